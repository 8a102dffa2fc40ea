#include "adopt/hands.h"

#include <array>
#include <cerrno>
#include <chrono>
#include <csignal>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <stdexcept>
#include <support/atomicfile.h>
#include <support/process.h>
#include <sys/stat.h>
#include <thread>
#include <unistd.h>

namespace vornovsctl {

namespace {

constexpr std::chrono::seconds kLongestRun{120};
constexpr std::chrono::milliseconds kPatience{3000};
constexpr std::chrono::milliseconds kGlance{20};
constexpr mode_t kPermissions = 07777;

[[noreturn]] void Fail(const std::string& what, const std::string& path)
{
    throw std::runtime_error(what + ' ' + path + ": " + std::strerror(errno));
}

std::string NameOfProcess(pid_t process)
{
    std::ifstream file("/proc/" + std::to_string(process) + "/comm");
    std::string name;
    std::getline(file, name);
    return name;
}

bool EndsIn(pid_t process, std::chrono::milliseconds patience)
{
    for (std::chrono::milliseconds waited{0}; waited < patience; waited += kGlance) {
        if (kill(process, 0) != 0) {
            return true;
        }
        std::this_thread::sleep_for(kGlance);
    }
    return false;
}

} // namespace

std::optional<SavedFile> Hands::Read(const std::string& path) const
{
    std::ifstream file(m_root + path);
    struct stat status {};
    if (!file || stat((m_root + path).c_str(), &status) != 0 || !S_ISREG(status.st_mode)) {
        return std::nullopt;
    }
    std::ostringstream text;
    if (status.st_size > 0) {
        text << file.rdbuf();
    }
    return SavedFile{text.str(), status.st_mode & kPermissions, status.st_uid, status.st_gid};
}

void Hands::Write(const std::string& path, const std::string& text, unsigned mode)
{
    std::error_code ignored; // a folder that could not be made is told of by the file
    std::filesystem::create_directories(std::filesystem::path(m_root + path).parent_path(),
                                        ignored);
    if (!vornhost::ReplaceFile(m_root + path, text, mode)) {
        Fail("cannot write", path);
    }
}

void Hands::Restore(const std::string& path, const SavedFile& file)
{
    if (const auto now = Read(path); now == file) {
        return;
    }
    Write(path, file.text, file.mode);
    const std::string whole = m_root + path;
    if (chown(whole.c_str(), file.user, file.group) != 0 || chmod(whole.c_str(), file.mode) != 0) {
        Fail("cannot give its owner and mode back to", path);
    }
}

void Hands::Remove(const std::string& path)
{
    if (unlink((m_root + path).c_str()) != 0 && errno != ENOENT && errno != ENOTDIR) {
        Fail("cannot remove", path);
    }
}

void Hands::RemoveEmptyFolder(const std::string& path)
{
    (void)rmdir((m_root + path).c_str());
}

bool Hands::Feed(const std::vector<std::string>& argv, const std::string& input)
{
    constexpr std::array kFolders{"/usr/bin/", "/usr/sbin/", "/bin/", "/sbin/", ""};
    for (const char* folder : kFolders) {
        std::vector<std::string> words = argv;
        words[0].insert(0, folder);
        if (access(words[0].c_str(), X_OK) == 0) {
            vornhost::ProcessOptions options;
            options.deadline = kLongestRun;
            options.input = input;
            return vornhost::RunProcess(words, options).Succeeded();
        }
    }
    return false;
}

void Hands::EndProcess(const std::string& pidFile, const std::string& program)
{
    std::ifstream file(m_root + pidFile);
    pid_t process = 0;
    if (!(file >> process) || process <= 1 || NameOfProcess(process) != program) {
        return;
    }
    (void)kill(process, SIGTERM);
    if (!EndsIn(process, kPatience)) {
        (void)kill(process, SIGKILL);
        (void)EndsIn(process, kPatience);
    }
}

} // namespace vornovsctl
