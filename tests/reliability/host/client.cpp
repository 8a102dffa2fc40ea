#include "host/client.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <csignal>
#include <cstdio>
#include <exception>
#include <map>
#include <stdexcept>

#include <fcntl.h>
#include <pthread.h>
#include <sys/mman.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <syslog.h>
#include <unistd.h>

namespace reliability {
namespace {

constexpr size_t kPageSize = 65536;

/** Of what the C library calls a set, only these bits are ever filled in. */
bool AreEqual(const sigset_t& one, const sigset_t& other)
{
    for (int signal = 1; signal < NSIG; ++signal) {
        if (::sigismember(&one, signal) != ::sigismember(&other, signal)) {
            return false;
        }
    }
    return true;
}

/** What the platform is to leave alone. */
struct Belongings {
    std::array<struct sigaction, NSIG> actions{};
    sigset_t mask{};
    std::map<int, std::pair<dev_t, ino_t>> descriptors;

    Belongings()
    {
        for (int signal = 1; signal < NSIG; ++signal) {
            (void)::sigaction(signal, nullptr, &actions[static_cast<size_t>(signal)]);
        }
        (void)::pthread_sigmask(SIG_SETMASK, nullptr, &mask);
        struct rlimit limit {};
        (void)::getrlimit(RLIMIT_NOFILE, &limit);
        constexpr rlim_t kOrdinary = 1024; // the limit may have been higher before
        const int last = static_cast<int>(std::max(limit.rlim_cur, kOrdinary));
        for (int number = 0; number < last; ++number) {
            struct stat status {};
            if (::fstat(number, &status) == 0) {
                descriptors[number] = {status.st_dev, status.st_ino};
            }
        }
    }

    /** @return  a signal that is handled otherwise there, 0 when there is none. */
    [[nodiscard]] int OtherAction(const Belongings& other) const
    {
        for (int signal = 1; signal < NSIG; ++signal) {
            const auto& mine = actions[static_cast<size_t>(signal)];
            const auto& its = other.actions[static_cast<size_t>(signal)];
            if (mine.sa_handler != its.sa_handler || mine.sa_flags != its.sa_flags ||
                !AreEqual(mine.sa_mask, its.sa_mask)) {
                return signal;
            }
        }
        return 0;
    }
};

void CompareBelongings(const Belongings& before, const Belongings& after, Findings& findings)
{
    const int signal = after.OtherAction(before);
    findings.Expect(signal == 0, "another handler of signal", std::to_string(signal).c_str());
    findings.Expect(AreEqual(before.mask, after.mask), "its signal mask is another");
    for (const auto& [number, file] : before.descriptors) {
        const auto found = after.descriptors.find(number);
        findings.Expect(found != after.descriptors.end(), "a descriptor of its was closed");
        findings.Expect(found == after.descriptors.end() || found->second == file,
                        "a descriptor of its was exchanged");
    }
    for (const auto& [number, file] : after.descriptors) {
        findings.Expect(before.descriptors.contains(number), "a descriptor was left open",
                        std::to_string(number).c_str());
    }
}

/** A client that reaps by itself may find one that is about to be gone; nobody else may. */
void ExpectNoChild(Findings& findings)
{
    int left = 0;
    for (int attempt = 0; attempt < 200; ++attempt) {
        left = ::waitpid(-1, nullptr, WNOHANG);
        if (left < 0 && errno == ECHILD) {
            return;
        }
        (void)::usleep(5000);
    }
    findings.Expect(false, "a child was left");
}

} // namespace

struct Findings::Page {
    size_t size;
    int result;
    std::array<char, kPageSize - 2 * sizeof(size_t)> text;
};

Findings::Findings()
    : m_page(static_cast<Page*>(
          ::mmap(nullptr, kPageSize, PROT_READ | PROT_WRITE, MAP_SHARED | MAP_ANONYMOUS, -1, 0)))
{
    if (m_page == MAP_FAILED) {
        throw std::runtime_error("no shared memory");
    }
}

Findings::~Findings()
{
    ::munmap(m_page, kPageSize);
}

void Findings::Expect(bool asItShouldBe, const char* words, const char* more)
{
    if (asItShouldBe) {
        return;
    }
    const size_t space = m_page->text.size() - m_page->size;
    const int size =
        std::snprintf(m_page->text.data() + m_page->size, space, "%s %s\n", words, more);
    m_page->size += std::min(space, static_cast<size_t>(size));
}

std::string Findings::Text() const
{
    return {m_page->text.data(), m_page->size};
}

void Findings::SetResult(int result)
{
    m_page->result = result;
}

int Findings::Result() const
{
    return m_page->result;
}

void RunClient(const std::vector<Trait>& traits, const std::function<void(Findings&)>& body,
               Findings& findings)
{
    const pid_t client = ::fork();
    if (client == 0) {
        try {
            (void)::alarm(kClientSeconds);
            for (const Trait& trait : traits) {
                trait.take();
            }
            const Belongings before;
            body(findings);
            ::closelog(); // the C library's own connection
            ExpectNoChild(findings);
            CompareBelongings(before, Belongings(), findings);
        } catch (const std::exception& error) {
            findings.Expect(false, "exception:", error.what());
        }
        ::_exit(0);
    }
    int status = -1;
    while (::waitpid(client, &status, 0) < 0 && errno == EINTR) {
    }
    findings.Expect(status == 0, "the client died with status", std::to_string(status).c_str());
}

std::string RunClient(const std::vector<Trait>& traits, const std::function<void(Findings&)>& body)
{
    Findings findings;
    RunClient(traits, body, findings);
    return findings.Text();
}

} // namespace reliability
