#include "kills/victim.h"

#include "support/filecalls.h"

#include <algorithm>
#include <array>
#include <csignal>
#include <cstring>

#include <sys/mman.h>
#include <sys/wait.h>
#include <unistd.h>

namespace reliability {

namespace {

constexpr std::size_t kLongestName = 512;

/** Counts the points of a child, and ends it at one of them. */
class Executioner {
public:
    Executioner(long nth, char* place) : m_left(nth), m_place(place) {}

    void Pass(const char* when, const std::string& call)
    {
        if (--m_left == 0) {
            const std::string point = std::string(when) + " " + call;
            point.copy(m_place, kLongestName - 1);
            (void)::kill(::getpid(), SIGKILL);
        }
    }

private:
    long m_left;
    char* m_place;
};

bool ChangesFiles(const std::string& operation)
{
    constexpr std::array kOperations{"open-new", "open-empty", "write",  "fsync",  "rename",
                                     "unlink",   "ftruncate",  "mkdir ", "fchmod", "fchown"};
    return std::any_of(kOperations.begin(), kOperations.end(),
                       [&](const char* verb) { return operation.starts_with(verb); });
}

/** What the child does. */
void Live(SharedHost& shared, const std::function<int()>& call, Executioner& executioner)
{
    harness::RecordingPlatform platform;
    unit::SimulatedHost host(platform, shared.Get());
    host.AllowChanges();
    platform.TakeRealLocks();
    std::string current;
    platform.Intercept([&](const std::string& text) -> std::optional<int> {
        current = text;
        executioner.Pass("before", current);
        return std::nullopt;
    });
    platform.Around([&] { shared.Enter(host); },
                    [&] {
                        shared.Leave(host);
                        if (!current.empty()) {
                            executioner.Pass("after", current);
                        }
                        current.clear();
                    });
    unit::FileCalls files;
    std::string operation;
    files.Watch(
        [&](const std::string& text) {
            operation = ChangesFiles(text) ? text : "";
            if (!operation.empty()) {
                executioner.Pass("before", operation);
            }
            return 0;
        },
        [&] {
            if (!operation.empty()) {
                executioner.Pass("after", operation);
            }
        });
    (void)call();
}

} // namespace

Death Kill(SharedHost& shared, const std::function<int()>& call, long nth)
{
    static char* const s_place = static_cast<char*>(
        ::mmap(nullptr, kLongestName, PROT_READ | PROT_WRITE, MAP_SHARED | MAP_ANONYMOUS, -1, 0));
    std::memset(s_place, 0, kLongestName);
    const pid_t child = ::fork();
    if (child == 0) {
        Executioner executioner(nth, s_place);
        Live(shared, call, executioner);
        ::_exit(testing::Test::HasFailure() ? 1 : 0);
    }
    int status = 0;
    EXPECT_EQ(::waitpid(child, &status, 0), child);
    const bool killed = WIFSIGNALED(status) && WTERMSIG(status) == SIGKILL;
    EXPECT_TRUE(killed || status == 0) << "the child ended with wait status " << status;
    return {killed, s_place};
}

} // namespace reliability
