#include "coredump/KernelDumpDornaRemove.h"

#include "kernctl/Storage.h"

namespace OstrelCli::System {

std::shared_ptr<KernelDumpDornaRemove> KernelDumpDornaRemove::New() {
    return AdoptSelf(std::shared_ptr<KernelDumpDornaRemove>(new KernelDumpDornaRemove));
}

KernelDumpDornaRemove::KernelDumpDornaRemove() {
    Describe(*this, "Remove a Brixkernel Dorna dump object from this system.", nullptr,
             "operation");
}

KernelDumpDornaRemove::~KernelDumpDornaRemove() = default;

std::shared_ptr<CallSpec::InputSpec> KernelDumpDornaRemove::GetInputSpecInternal() {
    return Params()
        .Add("force", CallSpec::PARAM_FLAG, "F",
             "Deactivate and unconfigure the Dorna dump object being removed.  This option is "
             "required if the object is active.",
             false)
        .Add("uuid", CallSpec::PARAM_STRING, "u",
             "Specify the UUID of the Dorna dump object to be removed.  If not given, the "
             "configured dump object will be removed.",
             false);
}

std::shared_ptr<CallSpec::OutputSpec> KernelDumpDornaRemove::GetOutputSpecInternal() {
    return Returns(MetaObj::MetaBool::New());
}

void KernelDumpDornaRemove::ExecuteInternal(InputPtr input, OutputPtr output) {
    Guard(*output, [&] {
        KernCtl::Storage::StorageInfoImpl storage;
        const bool force = input->HasParameter("force");
        std::string activeUuid;
        std::string configuredUuid;
        if (const auto active = storage.GetActiveDiagnosticDorna()) activeUuid = active->GetUuid();
        if (const auto configured = storage.GetConfiguredDiagnosticDorna()) {
            configuredUuid = configured->GetUuid();
        }
        std::string uuid = input->HasParameter("uuid") ? input->GetParameter("uuid") : "";
        if (uuid.empty()) {
            if (configuredUuid.empty()) return Fail(*output, "No configured object to remove.");
            uuid = configuredUuid;
        }
        if (uuid == activeUuid) {
            if (!force) {
                return Fail(*output, "Dorna dump object " + MessageExcerpt(uuid) +
                                         " is currently active.  The active Dorna dump object "
                                         "will only be removed if --force is specified.");
            }
            storage.DeactivateDiagnosticDorna();
        }
        // A configured object is unconfigured even without --force.
        if (uuid == configuredUuid) storage.UnconfigureDiagnosticDorna();
        if (!force) {
            uint32_t count = 0;
            if (!storage.GetDumpDornaReadCount(uuid, count)) {
                return Fail(*output, "Dorna dump object " + MessageExcerpt(uuid) +
                                         " read count could not be determined; Use --force to "
                                         "override check.");
            }
            if (count == 0) {
                return Fail(*output, "Dorna dump object " + MessageExcerpt(uuid) +
                                         " not read yet; Use --force to override check.");
            }
        }
        try {
            KernCtl::Storage::DiagnosticDornaImpl(uuid).DumpDornaRemove(uuid);
        } catch (const HostCtl::Lib::HostCtlException&) {
            return Fail(*output, "Removal of object " + MessageExcerpt(uuid) + " failed");
        }
        Succeed(*output);
    });
}

}  // namespace OstrelCli::System
