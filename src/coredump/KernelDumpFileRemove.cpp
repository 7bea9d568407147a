#include "coredump/KernelDumpFileRemove.h"

#include <cerrno>
#include <cstring>

#include "kernctl/Storage.h"
#include "os/HostOs.h"

namespace OstrelCli::System {

std::shared_ptr<KernelDumpFileRemove> KernelDumpFileRemove::New() {
    return AdoptSelf(std::shared_ptr<KernelDumpFileRemove>(new KernelDumpFileRemove));
}

KernelDumpFileRemove::KernelDumpFileRemove() {
    Describe(*this, "Remove a Brixkernel Dump DSFS file from this system.", nullptr, "operation");
}

KernelDumpFileRemove::~KernelDumpFileRemove() = default;

std::shared_ptr<CallSpec::InputSpec> KernelDumpFileRemove::GetInputSpecInternal() {
    return Params()
        .Add("force", CallSpec::PARAM_FLAG, "F",
             "Deactivate and unconfigure the dump file being removed.  This option is required if "
             "the file is active.",
             false)
        .Add("file", CallSpec::PARAM_STRING, "f",
             "Specify the file name of the Dump File to be removed.  If not given, the configured "
             "dump file will be removed.",
             false);
}

std::shared_ptr<CallSpec::OutputSpec> KernelDumpFileRemove::GetOutputSpecInternal() {
    return Returns(MetaObj::MetaBool::New());
}

void KernelDumpFileRemove::ExecuteInternal(InputPtr input, OutputPtr output) {
    Guard(*output, [&] {
        KernCtl::Storage::StorageInfoImpl storage;
        const bool force = input->HasParameter("force");
        std::string activePath;
        std::string configuredPath;
        if (const auto active = storage.GetActiveDiagnosticFile()) activePath = active->GetPath();
        if (const auto configured = storage.GetConfiguredDiagnosticFile()) {
            configuredPath = configured->GetPath();
        }
        std::string file = input->HasParameter("file") ? input->GetParameter("file") : "";
        if (file.empty()) {
            if (configuredPath.empty()) return Fail(*output, "No configured file to remove.");
            file = configuredPath;
        }
        if (file == activePath) {
            if (!force) {
                return Fail(*output, "Dump file " + MessageExcerpt(file) +
                                         " currently active, --force is required.");
            }
            storage.DeactivateDiagnosticFile();
        }
        // A configured file is unconfigured even without --force.
        if (file == configuredPath) storage.UnconfigureDiagnosticFile();
        if (!force) {
            uint32_t count = 0;
            if (!storage.GetDumpFileReadCount(file, count)) {
                return Fail(*output, "Dump file " + MessageExcerpt(file) +
                                         " read count could not be determined; Use --force to "
                                         "override check.");
            }
            if (count == 0) {
                return Fail(*output, "Dump file " + MessageExcerpt(file) +
                                         " not read yet; Use --force to override check.");
            }
        }
        if (HostOs::unlink(file.c_str()) != 0) {
            return Fail(*output, "Unlink of file " + MessageExcerpt(file) +
                                     " failed: " + std::strerror(errno));
        }
        Succeed(*output);
    });
}

}  // namespace OstrelCli::System
