#include "scene.h"

#include <algorithm>
#include <csignal>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <sstream>
#include <thread>
#include <utility>

#include <gtest/gtest.h>

#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>
#include <vornplatform/core.h>

namespace scene {

namespace fs = std::filesystem;

void WriteFile(const std::string& path, const std::string& text)
{
    std::ofstream file(path, std::ios::binary | std::ios::trunc);
    file << text << std::flush;
    ASSERT_TRUE(file.good()) << path;
}

std::string ReadFile(const std::string& path)
{
    std::ostringstream text;
    text << std::ifstream(path, std::ios::binary).rdbuf();
    return text.str();
}

void MakeFolder(const std::string& path)
{
    fs::create_directories(path);
}

std::string MakeScript(const std::string& path, const std::string& body)
{
    // A new file each time: one that is still open for writing somewhere cannot be run.
    const std::string draft = path + ".draft";
    WriteFile(draft, "#!/bin/sh\n" + body + "\n");
    EXPECT_EQ(::chmod(draft.c_str(), 0755), 0);
    fs::rename(draft, path);
    return path;
}

std::vector<std::string> Names(const std::string& folder)
{
    std::vector<std::string> names;
    for (const auto& entry : fs::directory_iterator(folder)) {
        names.push_back(entry.path().filename());
    }
    std::sort(names.begin(), names.end());
    return names;
}

bool Exists(const std::string& path)
{
    return fs::exists(fs::symlink_status(path));
}

bool Within(std::chrono::milliseconds limit, const std::function<bool()>& condition)
{
    const auto end = std::chrono::steady_clock::now() + limit;
    while (!condition()) {
        if (std::chrono::steady_clock::now() > end) {
            return false;
        }
        std::this_thread::sleep_for(std::chrono::milliseconds(5));
    }
    return true;
}

Child::Child(const std::function<int()>& body) : m_child(::fork())
{
    if (m_child == 0) {
        int result = 255;
        try {
            result = body();
        } catch (const std::exception& error) {
            std::cerr << error.what() << std::endl;
        }
        ::_exit(result);
    }
}

Child::~Child()
{
    if (m_child > 0) {
        Kill();
        (void)Wait();
    }
}

void Child::Kill()
{
    ::kill(m_child, SIGKILL);
}

int Child::Wait()
{
    int status = -1;
    const pid_t child = std::exchange(m_child, -1);
    EXPECT_EQ(::waitpid(child, &status, 0), child);
    return status;
}

int ResultOf(const std::function<int()>& body)
{
    const int status = Child(body).Wait();
    return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

bool IsLockFree()
{
    return ResultOf([] {
               int handle = -1;
               return VLIBCFileLockTimeByFile(kLockPath, 1, 0, &handle) < 0 ? 1 : 0;
           }) == 0;
}

} // namespace scene
