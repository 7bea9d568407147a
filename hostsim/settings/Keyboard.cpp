// Console keyboard layouts: the layouts available, the stored one and the one loaded into the
// running console.
#include <string>
#include <vector>

#include "cmdkit/Text.h"
#include "hostctl/HostCtlException.h"
#include "hostsim/core/Hooks.h"
#include "hostsim/core/Operation.h"
#include "hostsim/core/Store.h"
#include "kernctl/SystemInfoImpl.h"

using BrixSim::Store;

namespace {

const BrixSim::Operation kGetKeyboardLayout{"KernCtl::System::SystemInfoImpl::GetKeyboardLayout"};
const BrixSim::Operation kGetKeyboardLayouts{"KernCtl::System::SystemInfoImpl::GetKeyboardLayouts"};
const BrixSim::Operation kLoadKeyboardMappings{
    "KernCtl::System::SystemInfoImpl::LoadKeyboardMappings"};
const BrixSim::Operation kSetKeyboardLayout{"KernCtl::System::SystemInfoImpl::SetKeyboardLayout"};

constexpr char kStoredKey[] = "keyboard.layout";
constexpr char kLoadedKey[] = "keyboard.loaded";
constexpr char kDefaultLayout[] = "US Default";

const char* const kLayouts[] = {
    "Belgian",  "Brazilian",  "Croatian",       "Czech",     "Danish",       "Estonian",
    "Finnish",  "French",     "German",         "Greek",     "Icelandic",    "Italian",
    "Japanese", "Korean",     "Latin American", "Norwegian", "Polish",       "Portuguese",
    "Russian",  "Slovenian",  "Spanish",        "Swedish",   "Swiss French", "Swiss German",
    "Turkish",  "UK English", "US Default",     "US Dvorak", "Ukrainian",
};

const bool registered = [] {
    return BrixSim::RegisterTables({
        "keyboard",
        "CREATE TABLE IF NOT EXISTS keyboard_layouts ("
        " name TEXT PRIMARY KEY COLLATE NOCASE, seq INTEGER NOT NULL);",
        [](Store& store) {
            store.Write([&] {
                auto insert =
                    store.Prepare("INSERT INTO keyboard_layouts (name, seq) VALUES (?, ?)");
                int64_t seq = 0;
                for (const char* layout : kLayouts) {
                    insert.Bind(1, layout).Bind(2, ++seq).Run();
                    insert.Reset();
                }
                store.SetValue(kStoredKey, kDefaultLayout);
                store.SetValue(kLoadedKey, kDefaultLayout);
            });
        },
    });
}();

// A layout loaded for the current boot only gives way to the stored one.
const bool restarts = BrixSim::RegisterBootStep(
    [](Store& store) { store.SetValue(kLoadedKey, store.GetValue(kStoredKey, kDefaultLayout)); });

// The layout's name as the host spells it; names match without regard to case.
std::string Known(Store& store, const std::string& name) {
    auto row = store.Prepare("SELECT name FROM keyboard_layouts WHERE name = ?");
    row.Bind(1, name);
    if (!row.Step()) {
        throw HostCtl::Lib::HostCtlException("Unknown keyboard layout '" +
                                             CmdKit::MessageExcerpt(name) + "'");
    }
    return row.Text(0);
}

}  // namespace

namespace KernCtl::System {

std::string SystemInfoImpl::GetKeyboardLayout() {
    auto& store = Store::Get();
    store.Check(kGetKeyboardLayout);
    return store.GetValue(kStoredKey, kDefaultLayout);
}

std::vector<std::string> SystemInfoImpl::GetKeyboardLayouts() {
    auto& store = Store::Get();
    store.Check(kGetKeyboardLayouts);
    auto row = store.Prepare("SELECT name FROM keyboard_layouts ORDER BY seq");
    std::vector<std::string> layouts;
    while (row.Step()) layouts.push_back(row.Text(0));
    return layouts;
}

void SystemInfoImpl::SetKeyboardLayout(const std::string& name) {
    auto& store = Store::Get();
    store.Check(kSetKeyboardLayout);
    store.Write([&] {
        const auto layout = Known(store, name);
        store.SetValue(kStoredKey, layout);
        store.JournalCall(kSetKeyboardLayout, {name});
    });
}

void SystemInfoImpl::LoadKeyboardMappings(const std::string& name) {
    auto& store = Store::Get();
    store.Check(kLoadKeyboardMappings);
    store.Write([&] {
        // No name reloads the stored layout.
        const auto layout =
            name.empty() ? store.GetValue(kStoredKey, kDefaultLayout) : Known(store, name);
        store.SetValue(kLoadedKey, layout);
        store.JournalCall(kLoadKeyboardMappings, {name});
    });
}

}  // namespace KernCtl::System
