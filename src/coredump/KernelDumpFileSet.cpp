#include "coredump/KernelDumpFileSet.h"

#include "kernctl/Storage.h"

namespace OstrelCli::System {

std::shared_ptr<KernelDumpFileSet> KernelDumpFileSet::New() {
    return AdoptSelf(std::shared_ptr<KernelDumpFileSet>(new KernelDumpFileSet));
}

KernelDumpFileSet::KernelDumpFileSet() {
    Describe(*this, "Set the active and configured Brixkernel Dump DSFS file for this system.",
             nullptr, "operation");
}

KernelDumpFileSet::~KernelDumpFileSet() = default;

std::shared_ptr<CallSpec::InputSpec> KernelDumpFileSet::GetInputSpecInternal() {
    return Params()
        .Add("enable", CallSpec::PARAM_BOOL, "e",
             "Enable or disable the Brixkernel dump file. This option cannot be specified when "
             "unconfiguring the dump file.",
             false)
        .Add("smart", CallSpec::PARAM_FLAG, "s",
             "This flag can be used only with --enable=true. It will cause the file to be "
             "selected using the smart selection algorithm.",
             false)
        .Add("path", CallSpec::PARAM_STRING, "p",
             "The path of the DSFS Dump File to use. This must be a pre-allocated file.", false)
        .Add("unconfigure", CallSpec::PARAM_FLAG, "u", "Unconfigure the current DSFS Dump file.",
             false);
}

std::shared_ptr<CallSpec::OutputSpec> KernelDumpFileSet::GetOutputSpecInternal() {
    return Returns(MetaObj::MetaBool::New());
}

void KernelDumpFileSet::ExecuteInternal(InputPtr input, OutputPtr output) {
    const bool unconfigure = input->IsFlagSet("unconfigure");
    const bool smart = input->IsFlagSet("smart");
    KernCtl::Storage::StorageInfoImpl storage;
    const bool hasEnable = input->HasParameter("enable");
    const bool hasPath = input->HasParameter("path");
    if (hasEnable && (hasPath || unconfigure)) {
        return Fail(*output, "--enable cannot be combined with --path or --unconfigure.");
    }
    if (!hasEnable && smart) {
        return Fail(*output, "--smart can be specified only with --enable=true.");
    }
    if (hasPath && unconfigure) {
        return Fail(*output, "--unconfigure cannot be combined with --path.");
    }
    if (!unconfigure && !hasPath && !hasEnable) {
        return Fail(*output, "Please specify an action. Run with --help for details.");
    }
    Guard(*output, [&] {
        if (hasEnable) {
            const bool enable = input->GetParameterBool("enable");
            if (!enable && smart) {
                return Fail(*output, "--smart can be specified only with --enable=true.");
            }
            if (!enable) {
                storage.DeactivateDiagnosticFile();
            } else if (smart) {
                storage.SmartActivateDiagnosticFile();
            } else {
                storage.ActivateDiagnosticFile();
            }
        } else if (unconfigure) {
            storage.DeactivateDiagnosticFile();
            storage.UnconfigureDiagnosticFile();
        } else if (hasPath) {
            storage.SetDiagnosticFile(input->GetParameter("path"), true);
        } else {
            return Fail(*output,
                        "No action specified. One of --unconfigure, or --path is required.");
        }
        Succeed(*output);
    });
}

}  // namespace OstrelCli::System
