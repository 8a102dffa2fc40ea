/**
 * The system log as the tests see it: every line that any process of the sandbox sends to it.
 */
#ifndef VORNOVS_TESTS_HARNESS_SYSTEMLOG_H
#define VORNOVS_TESTS_HARNESS_SYSTEMLOG_H

#include <mutex>
#include <string>
#include <thread>
#include <vector>

namespace harness {

/** Serves /dev/log of the sandbox while it lives. */
class SystemLog {
public:
    /** Throws std::runtime_error when /dev/log cannot be had. */
    SystemLog();
    SystemLog(const SystemLog&) = delete;
    SystemLog& operator=(const SystemLog&) = delete;
    ~SystemLog();

    /** What was logged until now, in order, each as "<priority> <message>": "3 no such file". */
    std::vector<std::string> Lines();

private:
    void Serve();
    void Send(const std::string& datagram) const;

    int m_socket;
    std::mutex m_mutex;
    std::vector<std::string> m_datagrams;
    std::thread m_server;
};

} // namespace harness

#endif
