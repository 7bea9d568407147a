#include "coredump/KernelDumpDornaAdd.h"

#include "hostbase/HostBase.h"
#include "kernctl/Storage.h"

namespace OstrelCli::System {

std::shared_ptr<KernelDumpDornaAdd> KernelDumpDornaAdd::New() {
    return AdoptSelf(std::shared_ptr<KernelDumpDornaAdd>(new KernelDumpDornaAdd));
}

KernelDumpDornaAdd::KernelDumpDornaAdd() {
    Describe(*this, "Create a Brixkernel Dorna dump object for this system.", nullptr, "operation");
}

KernelDumpDornaAdd::~KernelDumpDornaAdd() = default;

std::shared_ptr<CallSpec::InputSpec> KernelDumpDornaAdd::GetInputSpecInternal() {
    return Params()
        .Add("size", CallSpec::PARAM_INT, "s",
             "The size (in MiB) of the created Dorna dump object.  If not provided, a default "
             "size, based on the configuration of the current machine, will be used.",
             false)
        .Add("auto", CallSpec::PARAM_FLAG, "a",
             "Automatically create a Dorna dump object if none is found and the "
             "autoCreateDumpDorna kernel option is set.",
             false)
        .Add("enable", CallSpec::PARAM_BOOL, "e",
             "Enable the Dorna diagnostic object after creation.", false);
}

std::shared_ptr<CallSpec::OutputSpec> KernelDumpDornaAdd::GetOutputSpecInternal() {
    return Returns(MetaObj::MetaBool::New());
}

void KernelDumpDornaAdd::ExecuteInternal(InputPtr input, OutputPtr output) {
    Guard(*output, [&] {
        KernCtl::Storage::StorageInfoImpl storage;
        Preference_Init();
        const uint64_t size =
            input->HasParameter("size") ? static_cast<uint64_t>(input->GetParameterInt("size")) : 0;
        const bool enable = input->HasParameter("enable") && input->GetParameterBool("enable");
        if (input->IsFlagSet("auto")) {
            storage.AutoAddDiagnosticDorna(size, enable);
        } else {
            storage.CreateDiagnosticDorna(size, enable);
        }
        Succeed(*output);
    });
}

}  // namespace OstrelCli::System
