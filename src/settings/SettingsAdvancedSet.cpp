#include "settings/SettingsAdvancedSet.h"

#include <cstdint>
#include <string>

#include "kernctl/Adv.h"
#include "settings/OptionViews.h"

namespace OstrelCli::System {

std::shared_ptr<SettingsAdvancedSet> SettingsAdvancedSet::New() {
    return AdoptSelf(std::shared_ptr<SettingsAdvancedSet>(new SettingsAdvancedSet));
}

SettingsAdvancedSet::SettingsAdvancedSet() {
    Describe(*this, "Set the value of an advanced option.", nullptr, "operation");
}

SettingsAdvancedSet::~SettingsAdvancedSet() = default;

std::shared_ptr<CallSpec::InputSpec> SettingsAdvancedSet::GetInputSpecInternal() {
    return Params()
        .Add("option", CallSpec::PARAM_STRING, "o",
             "The name of the option to set the value of. Example: \"/Misc/HostName\"", true)
        .Add("int-value", CallSpec::PARAM_INT, "i",
             "If the option is an integer value use this option.", false, IntRange(0, 4294967295LL))
        .Add("string-value", CallSpec::PARAM_STRING, "s",
             "If the option is a string use this option.", false)
        .Add("default", CallSpec::PARAM_FLAG, "d", "Reset the option to its default value.", false)
        .Done();
}

std::shared_ptr<CallSpec::OutputSpec> SettingsAdvancedSet::GetOutputSpecInternal() {
    return Returns(MetaObj::MetaBool::New());
}

void SettingsAdvancedSet::ExecuteInternal(InputPtr input, OutputPtr output) {
    GuardDetailed(*output, [&] {
        const std::string path = input->GetParameter("option");
        const bool hasInt = input->HasParameter("int-value");
        const bool hasString = input->HasParameter("string-value");
        const bool reset = input->IsFlagSet("default");
        if (int(hasInt) + int(hasString) + int(reset) != 1) {
            Fail(*output, "must specify exactly one of: int-value, string-value, default");
            return;
        }
        auto option = KernCtl::Adv::AdvancedOptionImpl::FindOption(path);
        if (!option) {
            Fail(*output, "unknown option: " + MessageExcerpt(path));
            return;
        }

        if (reset) {
            option->ResetToDefault();
            option->ClearOverride();
            option->ApplyChange();
            Succeed(*output);
            return;
        }

        const int type = option->GetType();
        if (type == HostCtl::Adv::ADV_OPTION_INTEGER) {
            bool missingValue = false;
            const bool found = WithIntegerView(*option, [&](auto& view) {
                if (!hasInt) {
                    missingValue = true;
                    return;
                }
                view.SetValue(static_cast<uint32_t>(input->GetParameterInt("int-value")));
            });
            if (!found) {
                Fail(*output,
                     "unable to access option '" + MessageExcerpt(path) + "' as integer option");
                return;
            }
            if (missingValue) {
                Fail(*output, "option is of type int, but input does not have int value");
                return;
            }
        } else if (type == HostCtl::Adv::ADV_OPTION_STRING) {
            bool missingValue = false;
            const bool found = WithStringView(*option, [&](auto& view) {
                if (!hasString) {
                    missingValue = true;
                    return;
                }
                view.SetValue(input->GetParameter("string-value"));
            });
            if (!found) {
                Fail(*output,
                     "unable to access option '" + MessageExcerpt(path) + "' as string option");
                return;
            }
            if (missingValue) {
                Fail(*output, "option is type of string, but input does not have string value");
                return;
            }
        } else {
            Fail(*output, "unable to access option '" + MessageExcerpt(path) +
                              "' as string or integer option");
            return;
        }
        option->ApplyChange();
        Succeed(*output);
    });
}

}  // namespace OstrelCli::System
