/**
 * A stand-in for systemd that answers at its socket of the sandbox and notes what it is asked.
 */
#ifndef VORNOVS_TESTS_HARNESS_FAKESYSTEMD_H
#define VORNOVS_TESTS_HARNESS_FAKESYSTEMD_H

#include <functional>
#include <map>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

namespace harness {

/** Runs while it lives; /run is the sandbox's own. */
class FakeSystemd {
public:
    /** What becomes of a job: systemd's word for its result, empty for one that does not end. */
    using Worker = std::function<std::string(const std::string& method, const std::string& unit)>;

    /** @param worker  does the jobs, in a thread of its own; all of them are "done" without. */
    explicit FakeSystemd(Worker worker = {});
    FakeSystemd(const FakeSystemd&) = delete;
    FakeSystemd& operator=(const FakeSystemd&) = delete;
    ~FakeSystemd();

    /**
     * Gives it a unit in that state, such as "active", "inactive" or "failed"; "x@.service" stands
     * for all of its instances. It has no others.
     */
    void AddUnit(const std::string& unit, const std::string& state = "inactive");
    /** Breaks the next connections so many times, after the request and before the answer. */
    void BreakConnections(int times);

    /** The jobs that were asked for, in order: "StartUnit vornovs-db.service". */
    std::vector<std::string> Jobs();

private:
    class Server;
    friend class Server;
    void Serve();

    Worker m_worker;
    std::mutex m_mutex;
    std::map<std::string, std::string> m_units;
    std::vector<std::string> m_jobs;
    int m_breaks = 0;
    int m_listener;
    int m_end; // written to when it goes
    std::thread m_server;
};

} // namespace harness

#endif
