#include "agents/SlpAgentStats.h"

#include "agents/SlpAgentGuard.h"
#include "hostctl/SlpAgent.h"

namespace OstrelCli::System {

namespace {

using HostCtl::System::SLPStats;

// One field of "SlpStats": exactly one of the three members is set. The names are the daemon's
// own labels and are kept as they are, spelling included.
struct StatField {
    const char* name;
    std::string SLPStats::*text;
    int32_t SLPStats::*count;
    int64_t SLPStats::*bytes;
};

constexpr StatField Text(const char* name, std::string SLPStats::*member) {
    return {name, member, nullptr, nullptr};
}
constexpr StatField Count(const char* name, int32_t SLPStats::*member) {
    return {name, nullptr, member, nullptr};
}
constexpr StatField Bytes(const char* name, int64_t SLPStats::*member) {
    return {name, nullptr, nullptr, member};
}

const StatField kFields[] = {
    Text("Date", &SLPStats::date),
    Text("Process ID", &SLPStats::processId),
    Text("Uptime", &SLPStats::uptime),
    Text("Last TCP connection accept", &SLPStats::lastTcpAccept),
    Count("TCP completed accepts", &SLPStats::tcpAccepts),
    Count("TCP accepts failed", &SLPStats::tcpAcceptsFailed),
    Count("TCP accepts toomany", &SLPStats::tcpAcceptsTooMany),
    Text("Last UDP packet received", &SLPStats::lastUdpReceived),
    Count("UDP pkts received ok", &SLPStats::udpReceived),
    Count("UDP pkts received failed", &SLPStats::udpReceiveFailed),
    Bytes("UDP pkts received bytes", &SLPStats::udpReceivedBytes),
    Count("UDP pkts transmitted ok", &SLPStats::udpSent),
    Count("UDP pkts transmitted failed", &SLPStats::udpSendFailed),
    Bytes("UDP pkts transmitted/bytes", &SLPStats::udpSentBytes),
    Count("SRVRQST type packets received", &SLPStats::srvRqstReceived),
    Count("SRVRPLY type packets sent", &SLPStats::srvRplySent),
    Count("SRVREG type packets received", &SLPStats::srvRegReceived),
    Count("SRVDREG type packets received", &SLPStats::srvDeRegReceived),
    Count("SRVACK type packets sent", &SLPStats::srvAckSent),
    Count("ATTRRQST type packets received", &SLPStats::attrRqstReceived),
    Count("ATRRPLY type packets sent", &SLPStats::attrRplySent),
    Count("DAADVERT type packets received", &SLPStats::daAdvertReceived),
    Count("SRVTYPERQST type packets received", &SLPStats::srvTypeRqstReceived),
    Count("SRVTYPERPLY type packets sent", &SLPStats::srvTypeRplySent),
    Count("SAADVERT type packets received", &SLPStats::saAdvertReceived),
    Count("SRVREG transactions failed", &SLPStats::srvRegFailed),
    Count("SRVDEREG transactions failed", &SLPStats::srvDeRegFailed),
    Count("SA SRV request receieved", &SLPStats::saSrvRqstReceived),
    Count("DA SRV request reccieved", &SLPStats::daSrvRqstReceived),
    Count("No reply sent", &SLPStats::noReplySent),
    Count("UDP Message truncated when sent", &SLPStats::udpTruncated),
    Count("Internal err", &SLPStats::internalErrors),
};

}  // namespace

void LoadStats(const SLPStats& stats, const std::shared_ptr<MetaObj::MetaStruct>& structure) {
    const auto& doc = MetaObj::MetaStruct::_docEmpty;
    for (const auto& field : kFields) {
        if (field.text != nullptr) {
            structure->SetField(field.name, stats.*field.text, doc);
        } else if (field.count != nullptr) {
            structure->SetField(field.name, static_cast<int>(stats.*field.count), doc);
        } else {
            // The byte counters outgrow 32 bits on a busy host; carried in full.
            structure->SetField(field.name, static_cast<long>(stats.*field.bytes), doc);
        }
    }
}

std::shared_ptr<SlpAgentStats> SlpAgentStats::New() {
    return AdoptSelf(std::shared_ptr<SlpAgentStats>(new SlpAgentStats));
}

SlpAgentStats::SlpAgentStats() {
    Describe(*this, "Report operational state of Service Location Protocol Daemon", "simple",
             "fetcher");
}

SlpAgentStats::~SlpAgentStats() = default;

std::shared_ptr<MetaObj::MetaStruct> SlpAgentStats::GetOutputStructure() {
    auto result = MetaObj::MetaStruct::New("SlpStats");
    for (const auto& field : kFields) {
        if (field.text != nullptr) {
            result->SetField(field.name, "", MetaObj::MetaStruct::_docEmpty);
        } else {
            result->SetField(field.name, 0, MetaObj::MetaStruct::_docEmpty);
        }
    }
    return result;
}

std::shared_ptr<CallSpec::InputSpec> SlpAgentStats::GetInputSpecInternal() {
    return Params();
}

std::shared_ptr<CallSpec::OutputSpec> SlpAgentStats::GetOutputSpecInternal() {
    return Returns(GetOutputStructure());
}

void SlpAgentStats::ExecuteInternal(InputPtr, OutputPtr output) {
    GuardSlp(*output, [&] {
        auto agent = HostCtl::System::SlpAgentFactory();
        auto result = GetOutputStructure();
        SLPStats stats;
        agent->GetStats(stats);
        LoadStats(stats, result);
        Answer(*output, result);
    });
}

}  // namespace OstrelCli::System
