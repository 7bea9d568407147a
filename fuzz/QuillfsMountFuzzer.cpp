// The mount data of a Quillfs RAM disk, as `mount(..., "quillfs", flags, data)` receives it.
#include <string>

#include "FuzzSupport.h"
#include "hostsim/memfs/QuillfsMount.h"

namespace {

bool ValidName(const std::string& name) {
    if (name.empty() || name.size() > 63 || name == "." || name == "..") return false;
    for (char c : name) {
        const bool ok = (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') ||
                        (c >= '0' && c <= '9') || c == '_' || c == '-' || c == '.';
        if (!ok) return false;
    }
    return true;
}

std::string Octal(int64_t value) {
    std::string digits;
    do {
        digits.insert(digits.begin(), static_cast<char>('0' + value % 8));
        value /= 8;
    } while (value != 0);
    return digits;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    const std::string text(BrixFuzz::Text(data, size));
    const auto options = BrixSim::Quillfs::ParseMountData(text);
    if (!options) return 0;
    constexpr int64_t u32 = 4294967295;
    BRIX_FUZZ_CHECK(options->reservedMib >= 0 && options->reservedMib <= options->maxMib &&
                        options->maxMib <= u32,
                    text);
    BRIX_FUZZ_CHECK(options->reservedInodes >= 0 && options->maxInodes > 0 &&
                        options->reservedInodes <= options->maxInodes && options->maxInodes <= u32,
                    text);
    BRIX_FUZZ_CHECK(options->permissions >= 0 && options->permissions <= 07777, text);
    BRIX_FUZZ_CHECK(ValidName(options->name), text);
    // The options written back as mount data read the same.
    const std::string again =
        std::to_string(options->reservedMib) + "," + std::to_string(options->maxMib) + "," +
        std::to_string(options->reservedInodes) + "," + std::to_string(options->maxInodes) + "," +
        (options->coredump ? "1" : "0") + "," + Octal(options->permissions) + "," + options->name;
    const auto reparsed = BrixSim::Quillfs::ParseMountData(again);
    BRIX_FUZZ_CHECK(
        reparsed && reparsed->reservedMib == options->reservedMib &&
            reparsed->maxMib == options->maxMib &&
            reparsed->reservedInodes == options->reservedInodes &&
            reparsed->maxInodes == options->maxInodes && reparsed->coredump == options->coredump &&
            reparsed->permissions == options->permissions && reparsed->name == options->name,
        text + " -> " + again);
    return 0;
}
