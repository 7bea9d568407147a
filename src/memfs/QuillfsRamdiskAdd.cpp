#include "memfs/QuillfsRamdiskAdd.h"

#include <cerrno>
#include <cstdint>
#include <cstring>

#include "os/HostOs.h"

namespace OstrelCli::System {

std::shared_ptr<QuillfsRamdiskAdd> QuillfsRamdiskAdd::New(bool inodeOptions) {
    return AdoptSelf(std::shared_ptr<QuillfsRamdiskAdd>(new QuillfsRamdiskAdd(inodeOptions)));
}

QuillfsRamdiskAdd::QuillfsRamdiskAdd(bool inodeOptions) : inodeOptions_(inodeOptions) {
    Describe(*this, "Add a new Quillfs RAM disk to the Brix Host and mount it.", nullptr,
             "operation");
}

QuillfsRamdiskAdd::~QuillfsRamdiskAdd() = default;

std::shared_ptr<CallSpec::InputSpec> QuillfsRamdiskAdd::GetInputSpecInternal() {
    Params params;
    params.Add("min-size", CallSpec::PARAM_INT, "m", "Minimum size (min reservation in MiB)", true)
        .Add("max-size", CallSpec::PARAM_INT, "M", "Maximum size (max reservation in MiB)", true);
    if (inodeOptions_) {
        params
            .Add("reserved-inodes", CallSpec::PARAM_INT, "i", "Number of reserved inodes", false,
                 IntRange(1, 2147483647))
            .Add("max-inodes", CallSpec::PARAM_INT, "I", "Maximum number of inodes", false)
            .Add("coredump", CallSpec::PARAM_FLAG, "d", "Include this ramdisk as part of coredumps",
                 false);
    }
    params
        .Add("permissions", CallSpec::PARAM_STRING, "p",
             "Permissions for the root of the ramdisk (mode)", true)
        .Add("name", CallSpec::PARAM_STRING, "n", "Name for the ramdisk", true)
        .Add("target", CallSpec::PARAM_STRING, "t", "Mountpoint for the ramdisk (absolute path)",
             true);
    return params;
}

std::shared_ptr<CallSpec::OutputSpec> QuillfsRamdiskAdd::GetOutputSpecInternal() {
    return Returns(MetaObj::MetaBool::New());
}

void QuillfsRamdiskAdd::ExecuteInternal(InputPtr input, OutputPtr output) {
    const std::string target = input->GetParameter("target");
    // Taken whole (a negative count as a huge one): the kernel refuses what it cannot hold.
    uint64_t reservedInodes = 0;
    uint64_t maxInodes = 0;
    bool coredump = false;
    if (inodeOptions_) {
        if (input->HasParameter("reserved-inodes")) {
            reservedInodes = static_cast<uint64_t>(input->GetParameterInt("reserved-inodes"));
        }
        if (input->HasParameter("max-inodes")) {
            maxInodes = static_cast<uint64_t>(input->GetParameterInt("max-inodes"));
        }
        if (reservedInodes > maxInodes) {
            Fail(*output, "reserved-inodes cannot be greater than max-inodes");
            return;
        }
        coredump = input->IsFlagSet("coredump");
    }
    // The sizes go to the kernel as they were typed.
    const std::string data = input->GetParameter("min-size") + "," +
                             input->GetParameter("max-size") + "," +
                             std::to_string(reservedInodes) + "," + std::to_string(maxInodes) +
                             "," + (coredump ? "1" : "0") + "," +
                             input->GetParameter("permissions") + "," + input->GetParameter("name");
    Guard(*output, [&] {
        if (HostOs::mount("", target.c_str(), "quillfs", 0, data.c_str()) != 0) {
            Fail(*output, std::strerror(errno));
            return;
        }
        Succeed(*output);
    });
}

}  // namespace OstrelCli::System
