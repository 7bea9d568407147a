#include "modules/GetModuleInfo.h"

#include <string>
#include <vector>

#include "kernctl/Module.h"

namespace OstrelCli::System {

namespace {

// No signature is read from the module: these fields are fixed placeholders.
const char kUnsigned[] = "Unsigned";
const char kNoDigest[] =
    "0000 0000 0000 0000 0000 0000 0000 0000 0000 0000 0000 0000 0000 0000 0000";
const char kNoFingerPrint[] = "0000 0000 0000 0000 0000 0000 0000 0000";

}  // namespace

void GetModuleInfo(KernCtl::System::ModuleImpl& module, MetaObj::MetaStruct& details) {
    const auto& doc = MetaObj::MetaStruct::_docEmpty;
    details.SetField("Module", module.GetName(), doc);
    details.SetField("Module File", module.GetModuleFile(), doc);
    details.SetField("License", module.GetLicense(), doc);
    details.SetField("Version", module.GetVersion(), doc);
    details.SetField("Build Type", module.GetBuildType(), doc);
    details.SetField("File Version", module.GetFileVersion(), doc);
    details.SetField("Signed Status", kUnsigned, doc);
    details.SetField("Signature Issuer", "", doc);
    details.SetField("Signature Digest", kNoDigest, doc);
    details.SetField("Signature FingerPrint", kNoFingerPrint, doc);
    details.SetField("Containing QPK", module.GetContainingPackage(), doc);
    details.SetField("QPK Acceptance Level", module.GetAcceptanceLevel(), doc);

    const auto provided = module.GetProvidedNamespace();
    details.SetField(
        "Provided Namespaces",
        provided.versions.empty() ? std::string() : provided.name + "@" + provided.versions.front(),
        doc);

    std::vector<std::string> required;
    for (const auto& ns : module.GetRequiredNamespaces()) {
        for (const auto& version : ns.versions) required.push_back(ns.name + "@" + version);
    }
    details.SetField("Required Namespaces", required, doc);
}

}  // namespace OstrelCli::System
