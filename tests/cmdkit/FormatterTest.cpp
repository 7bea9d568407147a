// The formatters on structures, lists and scalars, with and without hints.
#include <gtest/gtest.h>

#include <climits>
#include <fstream>
#include <nlohmann/json.hpp>
#include <pugixml.hpp>
#include <sstream>

#include "FakeCommand.h"

namespace CmdKitTest {
namespace {

using Hints = std::map<std::string, std::string>;

std::shared_ptr<MetaObj::MetaStruct> DiskPrototype() {
    auto disk = MetaObj::MetaStruct::New("Disk");
    disk->SetField("Name", "", MetaObj::MetaStruct::_docEmpty);
    disk->SetField("Size", MetaObj::MetaInt::New(), MetaObj::MetaStruct::_docEmpty);
    disk->SetField("Mounted", false, MetaObj::MetaStruct::_docEmpty);
    disk->SetField("Tags", std::vector<std::string>{}, MetaObj::MetaStruct::_docEmpty);
    return disk;
}

// Filled in a different order from the prototype, as a careless command might.
std::shared_ptr<MetaObj::MetaStruct> Disk(const std::string& name, std::optional<long> size,
                                          bool mounted, std::vector<std::string> tags) {
    auto disk = MetaObj::MetaStruct::New("Disk");
    disk->SetField("Mounted", mounted, MetaObj::MetaStruct::_docEmpty);
    disk->SetField("Name", name, MetaObj::MetaStruct::_docEmpty);
    disk->SetField("Size", size ? MetaObj::MetaInt::New(*size) : MetaObj::MetaInt::New(),
                   MetaObj::MetaStruct::_docEmpty);
    disk->SetField("Tags", tags, MetaObj::MetaStruct::_docEmpty);
    return disk;
}

std::shared_ptr<MetaObj::MetaList> Disks(bool empty = false) {
    auto list = MetaObj::MetaList::New(MetaObj::META_STRUCT, DiskPrototype());
    if (empty) return list;
    list->Add(Disk("ram0", 1024, true, {"fast", "tmp"}));
    list->Add(Disk("archive, \"old\"", std::nullopt, false, {}));
    return list;
}

// Runs a command answering `result` (declared as `prototype`) with the given hints.
CliRun Show(std::shared_ptr<MetaObj::MetaObject> result,
            std::shared_ptr<MetaObj::MetaObject> prototype, const Hints& hints,
            const std::string& formatter, const std::string& defaultFormatter = "simple") {
    auto command =
        FakeCommand::New(nullptr, prototype, [result](CallSpec::Input&, CallSpec::Output& output) {
            output.SetRootObject(result);
            output.SetComplete();
        });
    command->SetDefaultOutputFormatter(defaultFormatter);
    for (const auto& [key, value] : hints) command->SetDefaultOutputParameter(key, value);
    std::vector<std::string> args{"a", "b", "cmd"};
    if (!formatter.empty()) args.insert(args.begin(), "--formatter=" + formatter);
    return Invoke(TreeWith(command), args);
}

struct Expectation {
    std::string name;
    std::function<std::shared_ptr<MetaObj::MetaObject>()> result;
    Hints hints;
    std::string formatter;
    std::string out;
};

// Test output names the row instead of dumping its bytes.
void PrintTo(const Expectation& row, std::ostream* out) {
    *out << row.name;
}

class Formatter : public testing::TestWithParam<Expectation> {};

TEST_P(Formatter, Prints) {
    const auto& expected = GetParam();
    auto result = expected.result();
    std::shared_ptr<MetaObj::MetaObject> prototype;
    if (result->GetMetaType() == MetaObj::META_STRUCT) prototype = DiskPrototype();
    auto run = Show(result, prototype, expected.hints, expected.formatter);
    EXPECT_EQ(run.status, 0);
    EXPECT_EQ(run.err, "");
    EXPECT_EQ(run.out, expected.out);
}

std::string Name(const testing::TestParamInfo<Expectation>& info) {
    return info.param.name;
}

const Hints kDiskHints = {{"fields:Disk", "Name, Size,Tags"}, {"units:Disk.Size", "KiB"}};

// Stored text may hold anything: control characters (a terminal escape, a carriage return, NUL),
// bytes that are not UTF-8, the noncharacter U+FFFE and the C1 control U+009B.
using namespace std::string_literals;
const std::string kHostile =
    "a\x01"
    "b\xff"
    "c\r"
    "d\t"
    "e\x1b[0m"
    "\xef\xbf\xbe"
    "\xc2\x9b"
    "\0"
    "z"s;
const std::string kR = "\xef\xbf\xbd";  // U+FFFD, the replacement character

INSTANTIATE_TEST_SUITE_P(
    Table, Formatter,
    testing::Values(
        Expectation{
            "SimpleString", [] { return MetaObj::MetaString::New("text"); }, {}, "", "text\n"},
        Expectation{"SimpleInt", [] { return MetaObj::MetaInt::New(-42); }, {}, "simple", "-42\n"},
        Expectation{"SimpleNullInt", [] { return MetaObj::MetaInt::New(); }, {}, "simple", "\n"},
        Expectation{
            "SimpleBool", [] { return MetaObj::MetaBool::New(true); }, {}, "simple", "true\n"},
        Expectation{"SimpleStruct",
                    [] {
                        return Disk("ram0", 1024, true, {"a", "b"});
                    },
                    {},
                    "simple",
                    "Disk:\n   Name: ram0\n   Size: 1024\n   Mounted: true\n   Tags: a, b\n"},
        Expectation{"SimpleStructHints",
                    [] {
                        return Disk("ram0", 1024, true, {"a", "b"});
                    },
                    kDiskHints, "simple",
                    "Disk:\n   Name: ram0\n   Size: 1024 KiB\n   Tags: a, b\n"},
        Expectation{"SimpleStructNoHeader", [] { return Disk("ram0", std::nullopt, false, {}); },
                    Hints{{"show-header:Disk", "false"}, {"units:Disk.Size", "KiB"}}, "simple",
                    "Name: ram0\nSize:\nMounted: false\nTags:\n"},
        Expectation{"SimpleStrings",
                    [] {
                        auto list = MetaObj::MetaList::New(MetaObj::META_STRING);
                        list->Add("one");
                        list->Add(MetaObj::MetaString::New("two"));
                        return list;
                    },
                    {},
                    "simple",
                    "one\ntwo\n"},
        Expectation{"SimpleStructList", [] { return Disks(); }, kDiskHints, "simple",
                    "Disk:\n   Name: ram0\n   Size: 1024 KiB\n   Tags: fast, tmp\n\n"
                    "Disk:\n   Name: archive, \"old\"\n   Size:\n   Tags:\n"},
        Expectation{"SimpleEmptyList", [] { return Disks(true); }, {}, "simple", ""},
        Expectation{"Table", [] { return Disks(); }, kDiskHints, "table",
                    "Name            Size (KiB)  Tags\n"
                    "--------------  ----------  ---------\n"
                    "ram0            1024        fast, tmp\n"
                    "archive, \"old\"\n"},
        Expectation{"TableColumns", [] { return Disks(); },
                    Hints{{"table-columns", "Mounted,Name"}, {"fields:Disk", "Size"}}, "table",
                    "Mounted  Name\n"
                    "-------  --------------\n"
                    "true     ram0\n"
                    "false    archive, \"old\"\n"},
        Expectation{"TableAllFields",
                    [] { return Disks(); },
                    {},
                    "table",
                    "Name            Size  Mounted  Tags\n"
                    "--------------  ----  -------  ---------\n"
                    "ram0            1024  true     fast, tmp\n"
                    "archive, \"old\"        false\n"},
        Expectation{"TableEmpty", [] { return Disks(true); }, kDiskHints, "table",
                    "Name  Size (KiB)  Tags\n----  ----------  ----\n"},
        Expectation{"TableOfStructFallsBackToSimple",
                    [] { return Disk("ram0", 1, false, {}); },
                    {},
                    "table",
                    "Disk:\n   Name: ram0\n   Size: 1\n   Mounted: false\n   Tags:\n"},
        Expectation{"JsonScalar",
                    [] { return MetaObj::MetaString::New("a\"b"); },
                    {},
                    "json",
                    "\"a\\\"b\"\n"},
        Expectation{"JsonNullInt", [] { return MetaObj::MetaInt::New(); }, {}, "json", "null\n"},
        Expectation{"JsonEmptyList", [] { return Disks(true); }, {}, "json", "[]\n"},
        Expectation{"CsvList", [] { return Disks(); }, kDiskHints, "csv",
                    "Name,Size,Mounted,Tags\n"
                    "ram0,1024,true,\"fast, tmp\"\n"
                    "\"archive, \"\"old\"\"\",,false,\n"},
        Expectation{"CsvStruct",
                    [] { return Disk("x", 2, true, {}); },
                    {},
                    "csv",
                    "Name,Size,Mounted,Tags\nx,2,true,\n"},
        Expectation{
            "CsvScalar", [] { return MetaObj::MetaString::New("a,b"); }, {}, "csv", "\"a,b\"\n"},
        Expectation{"KeyValueList", [] { return Disks(); }, kDiskHints, "keyvalue",
                    "Disk[0].Name=ram0\nDisk[0].Size=1024\nDisk[0].Mounted=true\n"
                    "Disk[0].Tags[0]=fast\nDisk[0].Tags[1]=tmp\n"
                    "Disk[1].Name=archive, \"old\"\nDisk[1].Size=\nDisk[1].Mounted=false\n"
                    "Disk[1].Tags=\n"},
        Expectation{"KeyValueScalar",
                    [] { return MetaObj::MetaBool::New(false); },
                    {},
                    "keyvalue",
                    "Boolean=false\n"},
        Expectation{"XmlStruct",
                    [] { return Disk("r", std::nullopt, true, {"t"}); },
                    {},
                    "xml",
                    "<?xml version=\"1.0\"?>\n"
                    "<output>\n"
                    "  <structure typeName=\"Disk\">\n"
                    "    <field name=\"Name\">\n      <string>r</string>\n    </field>\n"
                    "    <field name=\"Size\">\n      <integer />\n    </field>\n"
                    "    <field name=\"Mounted\">\n      <boolean>true</boolean>\n    </field>\n"
                    "    <field name=\"Tags\">\n      <list type=\"string\">\n"
                    "        <string>t</string>\n      </list>\n    </field>\n"
                    "  </structure>\n"
                    "</output>\n"},
        Expectation{"HostileSimple",
                    [] { return MetaObj::MetaString::New(kHostile); },
                    {},
                    "simple",
                    "a" + kR + "b" + kR + "c" + kR + "d\te" + kR + "[0m" + kR + kR + kR + "z\n"},
        Expectation{"HostileKeyValue",
                    [] { return MetaObj::MetaString::New(kHostile); },
                    {},
                    "keyvalue",
                    "String=a" + kR + "b" + kR + "c\\rd\te" + kR + "[0m" + kR + kR + kR + "z\n"},
        Expectation{"HostileCsv",
                    [] { return MetaObj::MetaString::New(kHostile); },
                    {},
                    "csv",
                    "\"a" + kR + "b" + kR + "c\rd\te" + kR + "[0m" + kR + kR + kR + "z\"\n"},
        Expectation{"HostileJson",
                    [] { return MetaObj::MetaString::New(kHostile); },
                    {},
                    "json",
                    "\"a\\u0001b" + kR + "c\\rd\\te\\u001b[0m\xef\xbf\xbe\xc2\x9b\\u0000z\"\n"},
        Expectation{"HostileXml",
                    [] { return MetaObj::MetaString::New(kHostile); },
                    {},
                    "xml",
                    "<?xml version=\"1.0\"?>\n<output>\n  <string>a" + kR + "b" + kR +
                        "c&#13;d\te" + kR + "[0m" + kR + kR + kR + "z</string>\n</output>\n"}),
    Name);

TEST(Json, StructureKeysInDeclaredOrderWithAllFieldsAndExactIntegers) {
    auto list = MetaObj::MetaList::New(MetaObj::META_STRUCT, DiskPrototype());
    list->Add(Disk("max", LONG_MAX, true, {"x"}));
    list->Add(Disk("min", LONG_MIN, false, {}));
    list->Add(Disk("none", std::nullopt, false, {}));
    // The hints shape the screen formatters only.
    auto run =
        Show(list, nullptr, {{"fields:Disk", "Name"}, {"table-columns", "Name"}}, "json", "table");
    EXPECT_EQ(run.status, 0);
    const auto json = nlohmann::ordered_json::parse(run.out);
    EXPECT_EQ(json.dump(),
              R"([{"Name":"max","Size":9223372036854775807,"Mounted":true,"Tags":["x"]},)"
              R"({"Name":"min","Size":-9223372036854775808,"Mounted":false,"Tags":[]},)"
              R"({"Name":"none","Size":null,"Mounted":false,"Tags":[]}])");
    EXPECT_EQ(json[1]["Size"].get<int64_t>(), INT64_MIN);
    EXPECT_EQ(run.out.back(), '\n');
}

TEST(Json, SingleStructureAndNestedStructure) {
    auto outer = MetaObj::MetaStruct::New("Outer");
    outer->SetField("Inner", Disk("d", 5, true, {}), MetaObj::MetaStruct::_docEmpty);
    outer->SetField("Flag", MetaObj::MetaBool::New(false), MetaObj::MetaStruct::_docEmpty);
    auto run = Show(outer, nullptr, {}, "json");
    EXPECT_EQ(nlohmann::ordered_json::parse(run.out).dump(),
              R"({"Inner":{"Mounted":true,"Name":"d","Size":5,"Tags":[]},"Flag":false})");
}

TEST(Table, WithoutTerminalNothingIsCut) {
    auto list = MetaObj::MetaList::New(MetaObj::META_STRUCT, DiskPrototype());
    const std::string longName(500, 'n');
    list->Add(Disk(longName, 1, true, {}));
    auto run =
        Show(list, nullptr, {{"wrap-last", "true"}, {"table-columns", "Size,Name"}}, "", "table");
    EXPECT_NE(run.out.find("1     " + longName + "\n"), std::string::npos) << run.out;
}

TEST(Table, PrototypeWithoutFieldsTakesColumnsFromTheFirstRow) {
    auto list = MetaObj::MetaList::New(MetaObj::META_STRUCT, MetaObj::MetaStruct::New("Disk"));
    list->Add(Disk("d", 1, true, {}));
    auto run = Show(list, nullptr, {}, "table");
    EXPECT_EQ(run.out,
              "Mounted  Name  Size  Tags\n"
              "-------  ----  ----  ----\n"
              "true     d     1\n");
}

TEST(Table, HostileTextStaysInItsCell) {
    auto list = MetaObj::MetaList::New(MetaObj::META_STRUCT, DiskPrototype());
    list->Add(Disk(kHostile, 1, true, {}));
    auto run = Show(list, nullptr, {{"table-columns", "Mounted,Name"}}, "table");
    const std::string cell = "a" + kR + "b" + kR + "c d e" + kR + "[0m" + kR + kR + kR + "z";
    EXPECT_NE(run.out.find("\ntrue     " + cell + "\n"), std::string::npos) << run.out;
}

TEST(Default, CommandsFormatterUnlessOverridden) {
    auto run = Show(Disks(), nullptr, kDiskHints, "", "table");
    EXPECT_EQ(run.out.rfind("Name ", 0), 0u) << run.out;
    run = Show(Disks(), nullptr, kDiskHints, "simple", "table");
    EXPECT_EQ(run.out.rfind("Disk:\n", 0), 0u) << run.out;
}

// Rows handed out one at a time; a walk fails at row `failAt` when it is set.
class VectorRows : public MetaObj::RowSource {
  public:
    explicit VectorRows(std::vector<std::shared_ptr<MetaObj::MetaStruct>> rows, int failAt = -1)
        : rows_(std::move(rows)), failAt_(failAt) {}
    void Each(const std::function<void(std::shared_ptr<MetaObj::MetaStruct>)>& row) override {
        ++walks;
        for (int i = 0; i <= static_cast<int>(rows_.size()); ++i) {
            if (i == failAt_) throw MetaObj::RowError("Disk " + std::to_string(i) + " vanished");
            if (i < static_cast<int>(rows_.size())) row(rows_[i]);
        }
    }
    int walks = 0;

  private:
    std::vector<std::shared_ptr<MetaObj::MetaStruct>> rows_;
    int failAt_;
};

std::vector<std::shared_ptr<MetaObj::MetaStruct>> DiskRows() {
    return {Disk("ram0", 1024, true, {"fast", "tmp"}),
            Disk("archive, \"old\"", std::nullopt, false, {}),
            Disk(kHostile, -1, true, {kHostile, "\n"})};
}

TEST(StreamedList, EveryFormatterPrintsWhatTheListInMemoryPrints) {
    for (const bool empty : {false, true}) {
        const auto rows = empty ? std::vector<std::shared_ptr<MetaObj::MetaStruct>>{} : DiskRows();
        auto held = MetaObj::MetaList::New(MetaObj::META_STRUCT, DiskPrototype());
        for (const auto& row : rows) held->Add(row);
        for (const char* formatter : {"simple", "table", "json", "xml", "csv", "keyvalue"}) {
            SCOPED_TRACE(std::string(formatter) + (empty ? " empty" : ""));
            auto source = std::make_shared<VectorRows>(rows);
            auto streamed = MetaObj::MetaList::New(DiskPrototype(), source);
            const auto fromStream = Show(streamed, nullptr, kDiskHints, formatter);
            const auto fromMemory = Show(held, nullptr, kDiskHints, formatter);
            EXPECT_EQ(fromStream.status, 0);
            EXPECT_EQ(fromStream.out, fromMemory.out);
            // A table measures its columns first; no other walks twice.
            const bool twoPasses = std::string(formatter) == "table";
            EXPECT_EQ(source->walks, twoPasses ? 2 : 1);
        }
    }
}

// The documents written a row at a time are what the whole document would be.
TEST(StreamedList, JsonAndXmlMatchTheWholeDocument) {
    for (const bool empty : {false, true}) {
        const auto rows = empty ? std::vector<std::shared_ptr<MetaObj::MetaStruct>>{} : DiskRows();
        auto list = MetaObj::MetaList::New(DiskPrototype(), std::make_shared<VectorRows>(rows));
        const auto json = Show(list, nullptr, {}, "json").out;
        EXPECT_EQ(json, nlohmann::ordered_json::parse(json).dump(2) + "\n");

        const auto xml = Show(list, nullptr, {}, "xml").out;
        pugi::xml_document document;
        ASSERT_TRUE(document.load_string(xml.c_str(), pugi::parse_default | pugi::parse_ws_pcdata));
        std::ostringstream whole;
        document.save(whole, "  ", pugi::format_default, pugi::encoding_utf8);
        std::string expected = whole.str();
        // The writer keeps a carriage return as a reference, which a parser gives back raw.
        for (size_t at = expected.find('\r'); at != std::string::npos; at = expected.find('\r'))
            expected.replace(at, 1, "&#13;");
        EXPECT_EQ(xml, expected);
    }
}

TEST(StreamedList, RowsThatCannotBeReadEndTheCommandWithTheirMessage) {
    for (const char* formatter : {"simple", "table", "json", "xml", "csv", "keyvalue"}) {
        SCOPED_TRACE(formatter);
        // At the first row nothing has been written.
        auto atOnce =
            MetaObj::MetaList::New(DiskPrototype(), std::make_shared<VectorRows>(DiskRows(), 0));
        auto run = Show(atOnce, nullptr, {}, formatter);
        EXPECT_EQ(run.status, 1);
        EXPECT_EQ(run.out, "");
        EXPECT_EQ(run.err, "Disk 0 vanished\n");
        // Later, what was written stays and the message follows.
        auto later =
            MetaObj::MetaList::New(DiskPrototype(), std::make_shared<VectorRows>(DiskRows(), 2));
        run = Show(later, nullptr, {}, formatter);
        EXPECT_EQ(run.status, 1);
        EXPECT_EQ(run.err, "Disk 2 vanished\n");
    }
}

TEST(StreamedList, ABatchLineWhoseRowsFailReportsItInItsRecord) {
    auto command =
        FakeCommand::New(nullptr, nullptr, [](CallSpec::Input&, CallSpec::Output& output) {
            output.SetRootObject(MetaObj::MetaList::New(
                DiskPrototype(), std::make_shared<VectorRows>(DiskRows(), 1)));
            output.SetComplete();
        });
    const auto file = testing::TempDir() + "streamed-batch.txt";
    { std::ofstream(file) << "a b cmd\na b cmd --formatter=simple\n"; }
    auto run = Invoke(TreeWith(command), {"--formatter=json", "--batch", file});
    EXPECT_EQ(run.status, 1);
    std::istringstream lines(run.out);
    std::string line;
    ASSERT_TRUE(std::getline(lines, line));
    const auto record = nlohmann::ordered_json::parse(line);
    EXPECT_EQ(record["status"], 1);
    EXPECT_EQ(record["messages"], nlohmann::ordered_json::array({"Disk 1 vanished"}));
    EXPECT_TRUE(record["result"].is_null());
    run = Invoke(TreeWith(command), {"--batch", file});
    EXPECT_EQ(run.status, 1);
    EXPECT_EQ(run.err, "line 1: Disk 1 vanished\nline 2: Disk 1 vanished\n");
}

}  // namespace
}  // namespace CmdKitTest
