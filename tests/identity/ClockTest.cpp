// system time get|set and system stats uptime get on the simulated host's clock.
#include <cstdlib>
#include <optional>
#include <regex>

#include "HostStateTesting.h"

namespace {

using namespace HostStateTesting;

// Runs the programs in a chosen time zone (they take it from TZ), restoring the old one after.
class Clock : public testing::Test {
  protected:
    void SetUp() override {
        if (const char* tz = getenv("TZ")) saved_ = tz;
        Zone("UTC0");
    }
    void TearDown() override {
        if (saved_) {
            setenv("TZ", saved_->c_str(), 1);
        } else {
            unsetenv("TZ");
        }
    }
    static void Zone(const char* tz) { setenv("TZ", tz, 1); }

  private:
    std::optional<std::string> saved_;
};

std::string Now(const BrixTest::TempHost& host) {
    return Parsed(Json(host, {"system", "time", "get"})).get<std::string>();
}

TEST_F(Clock, GetPrintsLocalTimeWithZ) {
    BrixTest::TempHost host;
    const std::string now = Now(host);
    EXPECT_TRUE(std::regex_match(now, std::regex(R"(\d{4}-\d\d-\d\dT\d\d:\d\d:\d\dZ)"))) << now;
}

struct Setting {
    std::vector<std::string> options;
    std::string expectedPrefix;  // of the time get shows afterwards, from another process
};

TEST_F(Clock, SetNormalisesAndPersists) {
    const Setting cases[] = {
        // 31 February 2030 is 3 March.
        {{"--year", "2030", "--month", "2", "--day", "31"}, "2030-03-03T"},
        // Hour 24 is the next day's midnight.
        {{"-y", "2031", "-M", "5", "-d", "10", "-H", "24", "-m", "7", "-s", "9"},
         "2031-05-11T00:07:"},
        {{"-y", "2028", "-M", "12", "-d", "31", "-H", "23", "-m", "60"}, "2029-01-01T00:00:"},
        {{"-y", "2030", "-M", "1", "-d", "1", "-H", "1", "-m", "2", "-s", "60"},
         "2030-01-01T01:03:0"},
        {{"--year", "1970", "--month", "6"}, "1970-06-"},
    };
    for (const auto& setting : cases) {
        SCOPED_TRACE(setting.expectedPrefix);
        BrixTest::TempHost host;
        JournalMark mark(host);
        std::vector<std::string> words{"system", "time", "set"};
        words.insert(words.end(), setting.options.begin(), setting.options.end());
        EXPECT_EQ(Parsed(Json(host, words)), json(true));
        EXPECT_EQ(mark.Added({"settimeofday"}).size(), 1u);
        EXPECT_EQ(Now(host).substr(0, setting.expectedPrefix.size()), setting.expectedPrefix);
    }
}

TEST_F(Clock, UnsetFieldsKeepTheCurrentValue) {
    BrixTest::TempHost host;
    EXPECT_EQ(Parsed(Json(host, {"system", "time", "set", "-y", "2035"})), json(true));
    const std::string after = Now(host);
    EXPECT_EQ(after.substr(0, 4), "2035");
    auto real = host.Cli({"system", "time", "get"});  // another process, same host clock
    EXPECT_EQ(real.out.substr(0, 4), "2035");
}

struct Refusal {
    std::vector<std::string> options;
    std::string message;
};

TEST_F(Clock, RefusalsInOrderLeaveTheClock) {
    const Refusal cases[] = {
        {{}, "You must specify one of year, month, day, hour, minute or second"},
        {{"--year", "1969"}, "Year must be > 1970"},
        {{"--year", "-2030"}, "Year must be > 1970"},
        {{"--month", "0"}, "Month must be between 1 and 12"},
        {{"--month", "13"}, "Month must be between 1 and 12"},
        {{"--day", "0"}, "Invalid day"},
        {{"--day", "32"}, "Invalid day"},
        {{"--hour", "-1"}, "Invalid hour"},
        {{"--hour", "25"}, "Invalid hour"},
        {{"--min", "-1"}, "Invalid minute"},
        {{"--min", "61"}, "Invalid minute"},
        {{"--sec", "-1"}, "Invalid second"},
        {{"--sec", "61"}, "Invalid second"},
        // Checked in the order year, month, day, hour, minute, second.
        {{"--sec", "99", "--year", "1900", "--month", "13"}, "Year must be > 1970"},
        {{"--sec", "99", "--day", "0", "--month", "13"}, "Month must be between 1 and 12"},
        {{"--sec", "99", "--min", "99", "--hour", "99", "--day", "0"}, "Invalid day"},
        {{"--sec", "99", "--min", "99", "--hour", "99"}, "Invalid hour"},
        {{"--sec", "99", "--min", "99"}, "Invalid minute"},
        // A year no calendar record can hold.
        {{"--year", "9223372036854775807"}, "Invalid time"},
    };
    BrixTest::TempHost host;
    JournalMark mark(host);
    for (const auto& refusal : cases) {
        SCOPED_TRACE(refusal.message);
        std::vector<std::string> words{"system", "time", "set"};
        words.insert(words.end(), refusal.options.begin(), refusal.options.end());
        ExpectRefused(host.Cli(words), refusal.message);
    }
    EXPECT_TRUE(mark.Added({"settimeofday"}).empty());
}

// The fields are local time of the host's zone, printed with a "Z" all the same.
TEST_F(Clock, GetShowsLocalTime) {
    BrixTest::TempHost host;
    ASSERT_EQ(host.Cli({"system", "time", "set", "-y", "2026", "-M", "1", "-d", "5", "-H", "3",
                        "-m", "4", "-s", "5"})
                  .status,
              0);
    EXPECT_EQ(Now(host).substr(0, 18), "2026-01-05T03:04:0");
    Zone("XYZ-2");  // two hours east of UTC
    EXPECT_EQ(Now(host).substr(0, 18), "2026-01-05T05:04:0");
}

// A time before the clock's origin cannot be set.
TEST_F(Clock, ClockRefusesTimesBeforeItsOrigin) {
    BrixTest::TempHost host;
    Zone("XYZ-5");  // midnight, 1 January 1970 here is 19:00 the day before in UTC
    JournalMark mark(host);
    ExpectRefused(
        host.Cli({"system", "time", "set", "-y", "1970", "-M", "1", "-d", "1", "-H", "0"}),
        "Unable to set time: Invalid argument");
    EXPECT_TRUE(mark.Added({"settimeofday"}).empty());
}

TEST_F(Clock, UptimeInMicroseconds) {
    BrixTest::TempHost host;
    const auto uptime = Parsed(Json(host, {"system", "stats", "uptime", "get"}));
    ASSERT_TRUE(uptime.is_number_integer());
    // The seeded host booted 273645.12 seconds before it was made.
    EXPECT_GE(uptime.get<int64_t>(), 273'645'120'000LL);
    EXPECT_LT(uptime.get<int64_t>(), 273'645'120'000LL + 600'000'000LL);

    // Setting the clock does not move the uptime.
    ASSERT_EQ(host.Cli({"system", "time", "set", "-y", "2040"}).status, 0);
    const auto later = Parsed(Json(host, {"system", "stats", "uptime", "get"}));
    EXPECT_LT(later.get<int64_t>() - uptime.get<int64_t>(), 600'000'000LL);

    host.Fault("HostCtl::AdvStats::ServerStats::FetchAllStats", "statistics service down");
    ExpectRefused(host.Cli({"system", "stats", "uptime", "get"}),
                  "Unable to get system uptime: statistics service down");
}

}  // namespace
