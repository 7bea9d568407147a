#include "settings/FormatOption.h"

#include <string>

#include "hostctl/Adv.h"
#include "settings/OptionViews.h"

namespace OstrelCli::System {

namespace {

const auto& kDoc = MetaObj::MetaStruct::_docEmpty;

void SetIntegers(MetaObj::MetaStruct& row, long value) {
    for (const char* field : {"Int Value", "Default Int Value", "Min Value", "Max Value"}) {
        row.SetField(field, value, kDoc);
    }
}

void SetNoIntegers(MetaObj::MetaStruct& row) {
    for (const char* field : {"Int Value", "Default Int Value", "Min Value", "Max Value"}) {
        row.SetField(field, MetaObj::MetaInt::New(), kDoc);
    }
}

void SetStrings(MetaObj::MetaStruct& row, const std::string& value, const std::string& defaultValue,
                const std::string& validCharacters) {
    row.SetField("String Value", value, kDoc);
    row.SetField("Default String Value", defaultValue, kDoc);
    row.SetField("Valid Characters", validCharacters, kDoc);
}

// Integer values are unsigned 32-bit and widen without sign.
long Widen(uint32_t value) {
    return static_cast<long>(value);
}

}  // namespace

std::shared_ptr<MetaObj::MetaStruct> FormatOption(HostCtl::Adv::AdvancedOption& option, bool delta,
                                                  bool& include) {
    auto row = MetaObj::MetaStruct::New("SettingsAdvancedOption");
    include = true;
    const int type = option.GetType();
    const char* typeName = type == HostCtl::Adv::ADV_OPTION_INTEGER  ? "integer"
                           : type == HostCtl::Adv::ADV_OPTION_STRING ? "string"
                                                                     : "";
    row->SetField("Path", option.GetPath(), kDoc);
    row->SetField("Type", typeName, kDoc);

    if (type == HostCtl::Adv::ADV_OPTION_INTEGER) {
        const bool found = WithIntegerView(option, [&](auto& view) {
            if (delta && view.GetValue() == view.GetDefault()) include = false;
            row->SetField("Int Value", Widen(view.GetValue()), kDoc);
            row->SetField("Default Int Value", Widen(view.GetDefault()), kDoc);
            row->SetField("Min Value", Widen(view.GetMin()), kDoc);
            row->SetField("Max Value", Widen(view.GetMax()), kDoc);
            SetStrings(*row, "", "", "");
        });
        if (!found) {
            if (delta) include = false;
            SetIntegers(*row, -1);
            SetStrings(*row, "ERROR getting value", "", "");
        }
    } else if (type == HostCtl::Adv::ADV_OPTION_STRING) {
        const bool found = WithStringView(option, [&](auto& view) {
            if (delta && view.GetDefault() == view.GetValue()) include = false;
            SetNoIntegers(*row);
            const std::string value = view.GetValue();
            const std::string defaultValue = view.GetDefault();
            SetStrings(*row, value, defaultValue, view.GetValidCharacters());
        });
        if (!found) {
            if (delta) include = false;
            SetNoIntegers(*row);
            SetStrings(*row, "ERROR getting values", "", "");
        }
    }

    row->SetField("Description", option.GetDescription(), kDoc);
    return row;
}

void FormatBranch(HostCtl::Adv::AdvancedOptionBranch& branch, const RowCallback& row, bool delta) {
    for (const auto& option : branch.GetOptions()) {
        std::shared_ptr<MetaObj::MetaStruct> formatted;
        bool include = true;
        try {
            formatted = FormatOption(*option, delta, include);
        } catch (const HostCtl::Lib::HostCtlException&) {
            continue;  // an option that cannot be read is left out
        }
        if (include) row(std::move(formatted));
    }
    for (const auto& child : branch.GetBranches()) {
        try {
            FormatBranch(*child, row, delta);
        } catch (const HostCtl::Lib::HostCtlException&) {
            // rows of the failing branch already added stay; the walk goes on
        }
    }
}

}  // namespace OstrelCli::System
