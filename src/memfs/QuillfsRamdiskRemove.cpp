#include "memfs/QuillfsRamdiskRemove.h"

#include <cerrno>
#include <cstring>

#include "os/HostOs.h"

namespace OstrelCli::System {

std::shared_ptr<QuillfsRamdiskRemove> QuillfsRamdiskRemove::New() {
    return AdoptSelf(std::shared_ptr<QuillfsRamdiskRemove>(new QuillfsRamdiskRemove));
}

QuillfsRamdiskRemove::QuillfsRamdiskRemove() {
    Describe(*this, "Remove a Quillfs RAM disk from the Brix Host.", nullptr, "operation");
}

QuillfsRamdiskRemove::~QuillfsRamdiskRemove() = default;

std::shared_ptr<CallSpec::InputSpec> QuillfsRamdiskRemove::GetInputSpecInternal() {
    return Params().Add("target", CallSpec::PARAM_STRING, "t",
                        "Mountpoint for the ramdisk (absolute path)", true);
}

std::shared_ptr<CallSpec::OutputSpec> QuillfsRamdiskRemove::GetOutputSpecInternal() {
    return Returns(MetaObj::MetaBool::New());
}

void QuillfsRamdiskRemove::ExecuteInternal(InputPtr input, OutputPtr output) {
    const std::string target = input->GetParameter("target");
    Guard(*output, [&] {
        if (HostOs::umount(target.c_str()) != 0) {
            Fail(*output, std::strerror(errno));
            return;
        }
        Succeed(*output);
    });
}

}  // namespace OstrelCli::System
