#include "coredump/KernelDumpDornaSet.h"

#include "hostbase/HostBase.h"
#include "kernctl/Storage.h"

namespace OstrelCli::System {

std::shared_ptr<KernelDumpDornaSet> KernelDumpDornaSet::New() {
    return AdoptSelf(std::shared_ptr<KernelDumpDornaSet>(new KernelDumpDornaSet));
}

KernelDumpDornaSet::KernelDumpDornaSet() {
    Describe(*this,
             "Configure the Brixkernel Dorna Dump object for this system.  This command allows "
             "setting the active and configured dump object using either the Smart Activate "
             "method or an explicit UUID, as well as unconfiguring the dump object.",
             nullptr, "operation");
}

KernelDumpDornaSet::~KernelDumpDornaSet() = default;

std::shared_ptr<CallSpec::InputSpec> KernelDumpDornaSet::GetInputSpecInternal() {
    return Params()
        .Add("enable", CallSpec::PARAM_BOOL, "e",
             "Enable or disable the Brixkernel Dorna dump object. This option cannot be "
             "specified when unconfiguring the dump object.",
             false)
        .Add("smart", CallSpec::PARAM_FLAG, "s",
             "This flag can be used only with --enable=true. It will cause the dump object to be "
             "selected using the smart selection algorithm.",
             false)
        .Add("uuid", CallSpec::PARAM_STRING, "U", "The UUID of the Dorna dump object to use.",
             false)
        .Add("unconfigure", CallSpec::PARAM_FLAG, "u", "Unconfigure the current Dorna dump object.",
             false);
}

std::shared_ptr<CallSpec::OutputSpec> KernelDumpDornaSet::GetOutputSpecInternal() {
    return Returns(MetaObj::MetaBool::New());
}

void KernelDumpDornaSet::ExecuteInternal(InputPtr input, OutputPtr output) {
    const bool unconfigure = input->IsFlagSet("unconfigure");
    const bool smart = input->IsFlagSet("smart");
    const bool hasEnable = input->HasParameter("enable");
    Guard(*output, [&] {
        KernCtl::Storage::StorageInfoImpl storage;
        Preference_Init();
        const bool hasUuid = input->HasParameter("uuid");
        if (hasEnable && (hasUuid || unconfigure)) {
            return Fail(*output, "--enable cannot be combined with --uuid or --unconfigure.");
        }
        if (smart && (!hasEnable || !input->GetParameterBool("enable"))) {
            return Fail(*output, "--smart can be specified only with --enable=true.");
        }
        if (!hasEnable && !unconfigure && !hasUuid) {
            return Fail(*output, "Please specify an action (--enable or --unconfigure).");
        }
        if (unconfigure && hasUuid) {
            return Fail(*output, "--unconfigure cannot be combined with --uuid.");
        }
        if (hasEnable) {
            if (!input->GetParameterBool("enable")) {
                storage.DeactivateDiagnosticDorna();
            } else if (smart) {
                storage.SmartActivateDiagnosticDorna();
            } else {
                storage.ActivateDiagnosticDorna();
            }
        } else if (hasUuid) {
            storage.SetDiagnosticDorna(input->GetParameter("uuid"), true);
        } else {
            storage.DeactivateDiagnosticDorna();
            storage.UnconfigureDiagnosticDorna();
        }
        Succeed(*output);
    });
}

}  // namespace OstrelCli::System
