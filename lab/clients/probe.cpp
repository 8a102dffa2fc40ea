// Sends echo requests at a fixed interval and tells how long each target went without an answer.
//
//   probe INTERVAL OUTPUT (LABEL NAMESPACE TARGET[@SOURCE])...
//
// INTERVAL is in milliseconds. NAMESPACE is "here" or a name of ip-netns. Once every target has
// been answered the file OUTPUT.ready is made and the counting begins. SIGUSR1 begins the next
// phase. SIGUSR2 makes the interval five times as long, for the time in which little is expected.
// SIGTERM ends: a line a target is written to OUTPUT, separated by tabs:
//
//   LABEL TARGET[@SOURCE] GAP AT ANSWERED SENT PHASE-GAP [ANSWERED SENT PHASE-GAP]...
//
// GAP is the longest time between two answers beyond the interval, in ms, the time from the last
// answer to the end included; AT is when it began, in seconds since the counting began. PHASE-GAP
// is the longest of those that began in the phase.
//
// One program for all targets and both namespaces: with one timer for everything the guest wakes up
// once an interval, and two programs would keep each other waiting.
#include <algorithm>
#include <arpa/inet.h>
#include <array>
#include <cerrno>
#include <csignal>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <ctime>
#include <fcntl.h>
#include <linux/icmp.h>
#include <map>
#include <netinet/icmp6.h>
#include <poll.h>
#include <sched.h>
#include <string>
#include <sys/socket.h>
#include <unistd.h>
#include <vector>

namespace {

constexpr std::size_t kSequences = 65536;
constexpr std::size_t kPhases = 32;
constexpr double kLateAnswers = 0.2; // seconds that the last probes are given
constexpr double kRelaxed = 5;       // times the interval

volatile std::sig_atomic_t g_phase = 0;
volatile std::sig_atomic_t g_relax = 0;
volatile std::sig_atomic_t g_end = 0;

[[noreturn]] void Die(const std::string& what)
{
    std::fprintf(stderr, "probe: %s: %s\n", what.c_str(), std::strerror(errno));
    std::exit(1);
}

double Now()
{
    timespec now{};
    ::clock_gettime(CLOCK_MONOTONIC, &now);
    return static_cast<double>(now.tv_sec) + static_cast<double>(now.tv_nsec) / 1e9;
}

union Address {
    sockaddr any;
    sockaddr_in v4;
    sockaddr_in6 v6;
};

struct Target {
    std::string label;
    std::string name;
    Address address{};
    socklen_t length = 0;
    int socket = -1;
    double lastAnswer = 0;
    double interval = 0; // from it to the next request
    double gap = 0;
    double gapBegan = 0;
    std::array<unsigned, kPhases> sent{};
    std::array<unsigned, kPhases> answered{};
    std::array<double, kPhases> phaseGap{};
    std::size_t lastPhase = 0; // in which the last answer came
    std::vector<std::uint8_t> phaseOf = std::vector<std::uint8_t>(kSequences);
};

bool Parse(const std::string& text, Address& address, socklen_t& length)
{
    address = {};
    if (::inet_pton(AF_INET, text.c_str(), &address.v4.sin_addr) == 1) {
        address.v4.sin_family = AF_INET;
        length = sizeof(address.v4);
        return true;
    }
    address.v6.sin6_family = AF_INET6;
    length = sizeof(address.v6);
    return ::inet_pton(AF_INET6, text.c_str(), &address.v6.sin6_addr) == 1;
}

void EnterNamespace(const std::string& name, int own)
{
    const int file =
        name == "here" ? ::dup(own) : ::open(("/run/netns/" + name).c_str(), O_RDONLY | O_CLOEXEC);
    if (file < 0 || ::setns(file, CLONE_NEWNET) != 0) {
        Die("namespace " + name);
    }
    ::close(file);
}

/** A socket that receives echo replies only. */
int OpenSocket(int family, const std::string& source)
{
    const int handle = ::socket(family, SOCK_RAW | SOCK_NONBLOCK | SOCK_CLOEXEC,
                                family == AF_INET ? int{IPPROTO_ICMP} : int{IPPROTO_ICMPV6});
    if (handle < 0) {
        Die("socket");
    }
    if (family == AF_INET) {
        const icmp_filter filter{~(1U << ICMP_ECHOREPLY)};
        ::setsockopt(handle, SOL_RAW, ICMP_FILTER, &filter, sizeof(filter));
    } else {
        icmp6_filter filter{};
        ICMP6_FILTER_SETBLOCKALL(&filter);
        ICMP6_FILTER_SETPASS(ICMP6_ECHO_REPLY, &filter);
        ::setsockopt(handle, IPPROTO_ICMPV6, ICMP6_FILTER, &filter, sizeof(filter));
    }
    Address address{};
    socklen_t length = 0;
    if (!source.empty() &&
        (!Parse(source, address, length) || ::bind(handle, &address.any, length) != 0)) {
        Die("source " + source);
    }
    return handle;
}

std::vector<Target> OpenTargets(int argc, char** argv)
{
    const int own = ::open("/proc/self/ns/net", O_RDONLY | O_CLOEXEC);
    std::vector<Target> targets;
    std::map<std::string, int> sockets;
    for (int index = 3; index + 2 < argc; index += 3) {
        Target target;
        target.label = argv[index];
        target.name = argv[index + 2];
        const std::size_t at = target.name.find('@');
        const std::string source = at == std::string::npos ? "" : target.name.substr(at + 1);
        if (!Parse(target.name.substr(0, at), target.address, target.length)) {
            Die("address " + target.name);
        }

        const int family = target.address.any.sa_family;
        const std::string key =
            std::string(argv[index + 1]) + " " + std::to_string(family) + source;
        if (sockets.find(key) == sockets.end()) {
            EnterNamespace(argv[index + 1], own);
            sockets[key] = OpenSocket(family, source);
        }
        target.socket = sockets[key];
        targets.push_back(std::move(target));
    }
    return targets;
}

std::uint16_t Checksum(const icmphdr& header)
{
    std::array<std::uint16_t, sizeof(header) / 2> words{};
    std::memcpy(words.data(), &header, sizeof(header));
    std::uint32_t sum = 0;
    for (const std::uint16_t word : words) {
        sum += word;
    }
    sum = (sum >> 16) + (sum & 0xFFFFU);
    return static_cast<std::uint16_t>(~(sum + (sum >> 16)));
}

void Send(Target& target, std::size_t number, std::uint16_t sequence)
{
    const auto phase = static_cast<std::uint8_t>(g_phase);
    target.phaseOf[sequence] = phase;
    ++target.sent[phase];
    // The target's number is the identifier, so that an answer tells whose it is.
    if (target.address.any.sa_family == AF_INET) {
        icmphdr header{};
        header.type = ICMP_ECHO;
        header.un.echo.id = htons(static_cast<std::uint16_t>(number));
        header.un.echo.sequence = htons(sequence);
        header.checksum = Checksum(header);
        (void)!::sendto(target.socket, &header, sizeof(header), 0, &target.address.any,
                        target.length);
    } else {
        icmp6_hdr header{};
        header.icmp6_type = ICMP6_ECHO_REQUEST;
        header.icmp6_id = htons(static_cast<std::uint16_t>(number));
        header.icmp6_seq = htons(sequence);
        (void)!::sendto(target.socket, &header, sizeof(header), 0, &target.address.any,
                        target.length);
    }
}

void NoteGap(Target& target, double until)
{
    const double gap = until - target.lastAnswer - target.interval;
    if (gap > target.gap) {
        target.gap = gap;
        target.gapBegan = target.lastAnswer;
    }
    target.phaseGap[target.lastPhase] = std::max(target.phaseGap[target.lastPhase], gap);
}

void Receive(int socket, std::vector<Target>& targets, double interval)
{
    std::array<unsigned char, 2048> packet{};
    for (;;) {
        Address from{};
        socklen_t fromLength = sizeof(from);
        const ssize_t size =
            ::recvfrom(socket, packet.data(), packet.size(), 0, &from.any, &fromLength);
        if (size < 0) {
            return;
        }
        // IPv4 hands the IP header over as well; the echo headers of both families look alike.
        const std::size_t start = from.any.sa_family == AF_INET ? (packet[0] & 0x0FU) * 4U : 0;
        if (static_cast<std::size_t>(size) < start + 8) {
            continue;
        }
        const std::size_t number = packet[start + 4] * 256U + packet[start + 5];
        const std::size_t sequence = packet[start + 6] * 256U + packet[start + 7];
        if (number >= targets.size() || targets[number].socket != socket) {
            continue;
        }
        Target& target = targets[number];
        const double now = Now();
        NoteGap(target, now);
        target.lastAnswer = now;
        target.interval = interval;
        target.lastPhase = static_cast<std::size_t>(g_phase);
        ++target.answered[target.phaseOf[sequence]];
    }
}

bool AllAnswered(const std::vector<Target>& targets)
{
    return std::all_of(targets.begin(), targets.end(),
                       [](const Target& target) { return target.answered[0] > 0; });
}

void Restart(std::vector<Target>& targets)
{
    for (Target& target : targets) {
        target.gap = 0;
        target.gapBegan = target.lastAnswer;
        target.sent = {};
        target.answered = {};
        target.phaseGap = {};
    }
}

void Report(const std::string& path, const std::vector<Target>& targets, double began)
{
    std::FILE* const file = std::fopen((path + ".new").c_str(), "w");
    if (file == nullptr) {
        Die(path);
    }
    for (const Target& target : targets) {
        std::fprintf(file, "%s\t%s\t%.1f\t%.3f", target.label.c_str(), target.name.c_str(),
                     target.gap * 1000, target.gapBegan - began);
        for (int phase = 0; phase <= g_phase; ++phase) {
            const auto index = static_cast<std::size_t>(phase);
            std::fprintf(file, "\t%u\t%u\t%.1f", target.answered[index], target.sent[index],
                         target.phaseGap[index] * 1000);
        }
        std::fputc('\n', file);
    }
    if (std::fclose(file) != 0 || std::rename((path + ".new").c_str(), path.c_str()) != 0) {
        Die(path);
    }
}

void Touch(const std::string& path)
{
    const int file = ::open(path.c_str(), O_WRONLY | O_CREAT | O_CLOEXEC, 0644);
    if (file < 0) {
        Die(path);
    }
    ::close(file);
}

/** Waits for answers until a moment. */
void Listen(std::vector<pollfd>& sockets, std::vector<Target>& targets, double until,
            double interval)
{
    for (double left = until - Now(); left > 0; left = until - Now()) {
        timespec wait{};
        wait.tv_sec = static_cast<time_t>(left);
        wait.tv_nsec = static_cast<long>((left - static_cast<double>(wait.tv_sec)) * 1e9);
        if (::ppoll(sockets.data(), sockets.size(), &wait, nullptr) <= 0) {
            continue;
        }
        for (const pollfd& socket : sockets) {
            if (socket.revents != 0) {
                Receive(socket.fd, targets, interval);
            }
        }
    }
}

void BeRealTime()
{
    // The other host is a machine of its own: what the appliance computes must not delay it.
    sched_param parameter{};
    parameter.sched_priority = 50;
    if (::sched_setscheduler(0, SCHED_FIFO, &parameter) != 0) {
        Die("real-time priority");
    }
}

} // namespace

int main(int argc, char** argv)
{
    if (argc < 6 || argc % 3 != 0) {
        std::fprintf(stderr, "Usage: probe INTERVAL OUTPUT (LABEL NAMESPACE TARGET[@SOURCE])...\n");
        return 2;
    }
    const double interval = std::atof(argv[1]) / 1000;
    const std::string output = argv[2];
    std::vector<Target> targets = OpenTargets(argc, argv);
    std::vector<pollfd> sockets;
    for (const Target& target : targets) {
        if (std::none_of(sockets.begin(), sockets.end(),
                         [&](const pollfd& entry) { return entry.fd == target.socket; })) {
            sockets.push_back({target.socket, POLLIN, 0});
        }
    }
    std::signal(SIGUSR1, [](int) { g_phase = std::min<int>(g_phase + 1, kPhases - 1); });
    std::signal(SIGUSR2, [](int) { g_relax = 1; });
    std::signal(SIGTERM, [](int) { g_end = 1; });
    BeRealTime();

    double began = Now();
    double next = began;
    double present = interval;
    bool counting = false;
    std::uint16_t sequence = 0;
    while (g_end == 0) {
        present = g_relax == 0 ? interval : interval * kRelaxed;
        for (std::size_t number = 0; number < targets.size(); ++number) {
            Send(targets[number], number, sequence);
        }
        ++sequence;
        next += present;
        Listen(sockets, targets, next, present);
        if (!counting && AllAnswered(targets)) {
            counting = true;
            Restart(targets);
            began = Now();
            Touch(output + ".ready");
        }
    }

    const double end = Now();
    Listen(sockets, targets, end + kLateAnswers, present);
    for (Target& target : targets) {
        NoteGap(target, end);
    }
    Report(output, targets, began);
    return 0;
}
