#include "hostsim/agents/slp/SlpDaemon.h"

#include <chrono>
#include <cstdio>
#include <string>

#include "hostsim/core/Store.h"
#include "os/HostOs.h"

namespace BrixSim::Slp {

namespace {

using HostCtl::System::SLPStats;

// A 32-bit counter column, the member it fills, and its value in a new host: a service agent
// that has answered requests on a busy network for a few days.
struct Counter {
    const char* column;
    int32_t SLPStats::*member;
    int64_t seed;
};

constexpr Counter kCounters[] = {
    {"tcp_accepts", &SLPStats::tcpAccepts, 412},
    {"tcp_accepts_failed", &SLPStats::tcpAcceptsFailed, 3},
    {"tcp_accepts_toomany", &SLPStats::tcpAcceptsTooMany, 0},
    {"udp_received", &SLPStats::udpReceived, 1853204},
    {"udp_receive_failed", &SLPStats::udpReceiveFailed, 17},
    {"udp_sent", &SLPStats::udpSent, 1610477},
    {"udp_send_failed", &SLPStats::udpSendFailed, 2},
    {"srvrqst_received", &SLPStats::srvRqstReceived, 1742310},
    {"srvrply_sent", &SLPStats::srvRplySent, 1598006},
    {"srvreg_received", &SLPStats::srvRegReceived, 9214},
    {"srvdereg_received", &SLPStats::srvDeRegReceived, 311},
    {"srvack_sent", &SLPStats::srvAckSent, 9525},
    {"attrrqst_received", &SLPStats::attrRqstReceived, 2870},
    {"attrrply_sent", &SLPStats::attrRplySent, 2866},
    {"daadvert_received", &SLPStats::daAdvertReceived, 0},
    {"srvtyperqst_received", &SLPStats::srvTypeRqstReceived, 96},
    {"srvtyperply_sent", &SLPStats::srvTypeRplySent, 96},
    {"saadvert_received", &SLPStats::saAdvertReceived, 47},
    {"srvreg_failed", &SLPStats::srvRegFailed, 4},
    {"srvdereg_failed", &SLPStats::srvDeRegFailed, 1},
    {"sa_srvrqst_received", &SLPStats::saSrvRqstReceived, 1742310},
    {"da_srvrqst_received", &SLPStats::daSrvRqstReceived, 0},
    {"no_reply_sent", &SLPStats::noReplySent, 144290},
    {"udp_truncated", &SLPStats::udpTruncated, 6},
    {"internal_errors", &SLPStats::internalErrors, 0},
};

std::string Schema() {
    std::string sql =
        "CREATE TABLE IF NOT EXISTS slp_daemon ("
        " id INTEGER PRIMARY KEY CHECK (id = 1),"
        " pid INTEGER NOT NULL,"
        " started INTEGER NOT NULL,"   // real clock at the daemon's start, seconds
        " last_tcp_accept INTEGER,"    // host clock, seconds; NULL: none yet
        " last_udp_received INTEGER,"  // host clock, seconds; NULL: none yet
        " udp_received_bytes INTEGER NOT NULL CHECK (udp_received_bytes >= 0),"
        " udp_sent_bytes INTEGER NOT NULL CHECK (udp_sent_bytes >= 0)";
    for (const auto& counter : kCounters) {
        sql += std::string(", ") + counter.column + " INTEGER NOT NULL CHECK (" + counter.column +
               " BETWEEN 0 AND 2147483647)";
    }
    return sql + ");";
}

int64_t RealNow() {
    return std::chrono::duration_cast<std::chrono::seconds>(
               std::chrono::system_clock::now().time_since_epoch())
        .count();
}

void Seed(Store& store) {
    // Started a little over three days ago; last heard from the network moments before seeding.
    // A new host's clock is the real clock.
    const int64_t now = RealNow();
    std::string columns =
        "id, pid, started, last_tcp_accept, last_udp_received, "
        "udp_received_bytes, udp_sent_bytes";
    std::string values = "1, 2291, ?, ?, ?, 5312847219, 2904118733";
    for (const auto& counter : kCounters) {
        columns += std::string(", ") + counter.column;
        values += ", ?";
    }
    auto insert = store.Prepare("INSERT INTO slp_daemon (" + columns + ") VALUES (" + values + ")");
    insert.Bind(1, now - 276'729).Bind(2, now - 8'213).Bind(3, now - 4);
    int index = 4;
    for (const auto& counter : kCounters) insert.Bind(index++, counter.seed);
    insert.Run();
}

const bool registered = BrixSim::RegisterTables({"slp", Schema(), Seed});

std::string HostTimeText(time_t when) {
    struct tm broken = {};
    if (HostOs::localtime_r(&when, &broken) == nullptr) return std::to_string(when);
    char text[64];
    const size_t length = strftime(text, sizeof text, "%a %b %e %H:%M:%S %Y", &broken);
    return std::string(text, length);
}

std::string OptionalTimeText(const Stmt& row, int column) {
    return row.IsNull(column) ? "never" : HostTimeText(static_cast<time_t>(row.Int(column)));
}

std::string UptimeText(int64_t seconds) {
    if (seconds < 0) seconds = 0;
    const int64_t days = seconds / 86400;
    char clock[32];
    std::snprintf(clock, sizeof clock, "%02d:%02d:%02d", static_cast<int>(seconds / 3600 % 24),
                  static_cast<int>(seconds / 60 % 60), static_cast<int>(seconds % 60));
    if (days == 0) return clock;
    return std::to_string(days) + (days == 1 ? " day " : " days ") + clock;
}

}  // namespace

void ReadDaemonStats(SLPStats& stats) {
    std::string columns =
        "pid, started, last_tcp_accept, last_udp_received, udp_received_bytes, udp_sent_bytes";
    for (const auto& counter : kCounters) columns += std::string(", ") + counter.column;
    auto row = Store::Get().Prepare("SELECT " + columns + " FROM slp_daemon WHERE id = 1");
    stats = SLPStats{};
    stats.date = HostTimeText(HostOs::time(nullptr));
    if (!row.Step()) {
        // No daemon record: slpd is not running.
        stats.processId = "not running";
        stats.uptime = UptimeText(0);
        stats.lastTcpAccept = stats.lastUdpReceived = "never";
        return;
    }
    stats.processId = std::to_string(row.Int(0));
    stats.uptime = UptimeText(RealNow() - row.Int(1));
    stats.lastTcpAccept = OptionalTimeText(row, 2);
    stats.lastUdpReceived = OptionalTimeText(row, 3);
    stats.udpReceivedBytes = row.Int(4);
    stats.udpSentBytes = row.Int(5);
    int column = 6;
    for (const auto& counter : kCounters) {
        stats.*counter.member = static_cast<int32_t>(row.Int(column++));
    }
}

}  // namespace BrixSim::Slp
