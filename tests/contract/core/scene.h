/**
 * What the tests of the core library set up and look at.
 */
#ifndef VORNOVS_TESTS_CONTRACT_CORE_SCENE_H
#define VORNOVS_TESTS_CONTRACT_CORE_SCENE_H

#include <chrono>
#include <functional>
#include <string>
#include <vector>

#include <sys/types.h>

namespace scene {

constexpr char kLockPath[] = "/tmp/ovs_config.lock";

void WriteFile(const std::string& path, const std::string& text);
std::string ReadFile(const std::string& path);

/** Makes a folder with everything above it. */
void MakeFolder(const std::string& path);

/** Writes a shell script that can be run. @return its path. */
std::string MakeScript(const std::string& path, const std::string& body);

/** @return the names in a folder, sorted. */
std::vector<std::string> Names(const std::string& folder);

bool Exists(const std::string& path);

/** @return whether the condition held within the time. */
bool Within(std::chrono::milliseconds limit, const std::function<bool()>& condition);

/** A child of the test; what is left of it is killed. */
class Child {
public:
    /** @param body  its result is the child's exit status. */
    explicit Child(const std::function<int()>& body);
    Child(const Child&) = delete;
    Child& operator=(const Child&) = delete;
    ~Child();

    pid_t Id() const { return m_child; }
    void Kill();
    /** @return the wait status. */
    int Wait();

private:
    pid_t m_child;
};

/** Runs the body in a child. @return its exit status, -1 when it died. */
int ResultOf(const std::function<int()>& body);

/** @return whether the library's lock can be had at once, by a process of its own. */
bool IsLockFree();

} // namespace scene

#endif
