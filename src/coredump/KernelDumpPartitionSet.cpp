#include "coredump/KernelDumpPartitionSet.h"

#include "kernctl/Storage.h"

namespace OstrelCli::System {

std::shared_ptr<KernelDumpPartitionSet> KernelDumpPartitionSet::New() {
    return AdoptSelf(std::shared_ptr<KernelDumpPartitionSet>(new KernelDumpPartitionSet));
}

KernelDumpPartitionSet::KernelDumpPartitionSet() {
    Describe(*this,
             "Set the specific Brixkernel dump partition for this system. This will configure the "
             "dump partition for the next boot. This command will change the active dump "
             "partition to the partition specified.",
             nullptr, "operation");
}

KernelDumpPartitionSet::~KernelDumpPartitionSet() = default;

std::shared_ptr<CallSpec::InputSpec> KernelDumpPartitionSet::GetInputSpecInternal() {
    return Params()
        .Add("enable", CallSpec::PARAM_BOOL, "e",
             "Enable or disable the Brixkernel dump partition. This option cannot be specified "
             "when setting or unconfiguring the dump partition.",
             false)
        .Add("smart", CallSpec::PARAM_FLAG, "s",
             "This flag can be used only with --enable=true. It will cause the best available "
             "partition to be selected using the smart selection algorithm.",
             false)
        .Add("partition", CallSpec::PARAM_STRING, "p",
             "The name of the partition to use. This should be a device name with a partition "
             "number at the end. Example: naa.xxxxx:1",
             false)
        .Add("unconfigure", CallSpec::PARAM_FLAG, "u",
             "Set the dump partition into an unconfigured state. This will remove the current "
             "configured dump partition for the next boot. This will result in the smart "
             "activate algorithm being used at the next boot.",
             false);
}

std::shared_ptr<CallSpec::OutputSpec> KernelDumpPartitionSet::GetOutputSpecInternal() {
    return Returns(MetaObj::MetaBool::New());
}

void KernelDumpPartitionSet::ExecuteInternal(InputPtr input, OutputPtr output) {
    KernCtl::Storage::StorageInfoImpl storage;
    const bool unconfigure = input->IsFlagSet("unconfigure");
    const bool smart = input->IsFlagSet("smart");
    const bool hasEnable = input->HasParameter("enable");
    const bool hasPartition = input->HasParameter("partition");
    if (hasEnable && (hasPartition || unconfigure)) {
        return Fail(*output, "--enable cannot be combined with --partition or --unconfigure.");
    }
    if (!hasEnable && smart) {
        return Fail(*output, "--smart can be specified only with --enable=true.");
    }
    if (hasPartition && unconfigure) {
        return Fail(*output, "--partition and --unconfigure may not be specified simultaneously.");
    }
    if (!unconfigure && !hasPartition && !hasEnable) {
        return Fail(*output, "Please specify an action. Run with --help for details.");
    }
    Guard(*output, [&] {
        if (hasEnable) {
            const bool enable = input->GetParameterBool("enable");
            if (!enable && smart) {
                return Fail(*output, "--smart can be specified only with --enable=true.");
            }
            if (!enable) {
                storage.DeactivateDiagnosticPartition();
            } else if (smart) {
                storage.SmartActivateDiagnosticPartition();
            } else {
                storage.ActivateDiagnosticPartition();
            }
        } else if (unconfigure) {
            storage.DeactivateDiagnosticPartition();
            storage.UnconfigureDiagnosticPartition();
        } else if (hasPartition) {
            storage.SetDiagnosticPartition(input->GetParameter("partition"), true);
        } else {
            return Fail(*output,
                        "No action specified. One of --unconfigure, --partition, or --enable is "
                        "required.");
        }
        Succeed(*output);
    });
}

}  // namespace OstrelCli::System
