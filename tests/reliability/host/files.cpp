#include "host/files.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <sstream>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

namespace reliability {
namespace {

namespace fs = std::filesystem;

/** What is no text that the library writes is told by its time. */
constexpr off_t kMuch = 8192;

std::string Describe(const std::string& path, const struct stat& status)
{
    std::ostringstream text;
    text << std::oct << status.st_mode << " owner " << std::dec << status.st_uid << " ";
    if (S_ISLNK(status.st_mode)) {
        text << "to " << fs::read_symlink(path).string();
    } else if (S_ISREG(status.st_mode) && status.st_size > kMuch) {
        text << "bytes " << status.st_size << " of " << status.st_mtim.tv_nsec;
    } else if (S_ISREG(status.st_mode)) {
        text << "text " << ReadFile(path);
    }
    return text.str();
}

void AddTree(const std::string& folder, dev_t device, Tree& tree)
{
    std::error_code gone; // what a program removes meanwhile is not there
    for (const auto& entry : fs::directory_iterator(folder, gone)) {
        const std::string path = entry.path().string();
        struct stat status {};
        if (::lstat(path.c_str(), &status) != 0) {
            continue;
        }
        tree[path] = status.st_dev == device ? Describe(path, status) : "mounted";
        if (S_ISDIR(status.st_mode) && status.st_dev == device) {
            AddTree(path, device, tree);
        }
    }
}

} // namespace

std::string IfcfgPath(const std::string& interface)
{
    return std::string(kConfigurationFolder) + "/ifcfg-" + interface;
}

void WriteFile(const std::string& path, const std::string& text, mode_t mode)
{
    fs::create_directories(fs::path(path).parent_path());
    std::ofstream file(path, std::ios::binary | std::ios::trunc);
    file << text << std::flush;
    EXPECT_TRUE(file.good()) << path;
    EXPECT_EQ(::chmod(path.c_str(), mode), 0) << path;
}

std::string ReadFile(const std::string& path)
{
    const std::ifstream file(path, std::ios::binary);
    if (!file) {
        return "(none)";
    }
    std::ostringstream text;
    text << file.rdbuf();
    return text.str();
}

void Empty(const std::string& folder)
{
    for (const auto& entry : fs::directory_iterator(folder)) {
        fs::remove_all(entry.path());
    }
}

Tree ReadTree(const std::string& folder)
{
    Tree tree;
    struct stat status {};
    if (::stat(folder.c_str(), &status) == 0) {
        AddTree(folder == "/" ? "" : folder, status.st_dev, tree);
    }
    return tree;
}

std::map<std::string, std::string> Differences(const Tree& before, const Tree& after)
{
    std::map<std::string, std::string> differences;
    for (const auto& [path, description] : before) {
        const auto found = after.find(path);
        if (found == after.end()) {
            differences[path] = "is gone";
        } else if (found->second != description) {
            differences[path] = "was " + description + ", is " + found->second;
        }
    }
    for (const auto& [path, description] : after) {
        if (!before.contains(path)) {
            differences[path] = "is new: " + description;
        }
    }
    return differences;
}

} // namespace reliability
