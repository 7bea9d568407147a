#include "coredump/KernelDumpFileAdd.h"

#include "kernctl/Storage.h"

namespace OstrelCli::System {

std::shared_ptr<KernelDumpFileAdd> KernelDumpFileAdd::New() {
    return AdoptSelf(std::shared_ptr<KernelDumpFileAdd>(new KernelDumpFileAdd));
}

KernelDumpFileAdd::KernelDumpFileAdd() {
    Describe(*this, "Create a Brixkernel Dump DSFS file for this system.", nullptr, "operation");
}

KernelDumpFileAdd::~KernelDumpFileAdd() = default;

std::shared_ptr<CallSpec::InputSpec> KernelDumpFileAdd::GetInputSpecInternal() {
    return Params()
        .Add("size", CallSpec::PARAM_INT, "s",
             "Manually set the size in MB of the created Dump File.  If not provided, a default "
             "size for the current machine will be calculated.",
             false)
        .Add("datastore", CallSpec::PARAM_STRING, "d",
             "Manually specify the datastore the Dump File is created in.  If not provided, a "
             "datastore of sufficient size will be automatically chosen.",
             false)
        .Add("file", CallSpec::PARAM_STRING, "f",
             "Manually specify the file name of the created Dump File.  If not provided, a "
             "unique name will be chosen.",
             false)
        .Add("auto", CallSpec::PARAM_FLAG, "a",
             "Automatically create a file if none found and autoCreateDumpFile kernel option is "
             "set.",
             false)
        .Add("enable", CallSpec::PARAM_BOOL, "e", "Enable diagnostic file after creation.", false);
}

std::shared_ptr<CallSpec::OutputSpec> KernelDumpFileAdd::GetOutputSpecInternal() {
    return Returns(MetaObj::MetaBool::New());
}

void KernelDumpFileAdd::ExecuteInternal(InputPtr input, OutputPtr output) {
    Guard(*output, [&] {
        KernCtl::Storage::StorageInfoImpl storage;
        const uint64_t size =
            input->HasParameter("size") ? static_cast<uint64_t>(input->GetParameterInt("size")) : 0;
        const std::string datastore =
            input->HasParameter("datastore") ? input->GetParameter("datastore") : std::string();
        const std::string file =
            input->HasParameter("file") ? input->GetParameter("file") : std::string();
        const bool enable = input->HasParameter("enable") && input->GetParameterBool("enable");
        if (input->IsFlagSet("auto")) {
            storage.AutoAddDiagnosticFile(size, datastore, file, enable);
        } else {
            storage.CreateDiagnosticFile(size, datastore, file, enable);
        }
        Succeed(*output);
    });
}

}  // namespace OstrelCli::System
