#include "tools.h"

#include "support/process.h"

#include <filesystem>
#include <fstream>
#include <gtest/gtest.h>
#include <sstream>
#include <sys/wait.h>

namespace contract {

void PrintTo(const Outcome& outcome, std::ostream* stream)
{
    *stream << "exit code " << outcome.exitCode << ", output '" << outcome.output << "', errors '"
            << outcome.errors << "'";
}

Outcome RunProgram(const std::vector<std::string>& argv)
{
    std::vector<std::string> whole = argv;
    if (whole[0].find('/') == std::string::npos) {
        whole.insert(whole.begin(), "/usr/bin/env");
    }
    vornhost::ProcessOptions options;
    options.deadline = std::chrono::seconds(100);
    const auto result = vornhost::RunProcess(whole, options);
    const bool exited = result.status >= 0 && !result.timedOut && WIFEXITED(result.status);
    return {exited ? WEXITSTATUS(result.status) : -1, result.output, result.errors};
}

void Ip(const std::string& line)
{
    std::istringstream text(line);
    std::vector<std::string> argv{"ip"};
    for (std::string word; text >> word;) {
        argv.push_back(word);
    }
    const Outcome outcome = RunProgram(argv);
    EXPECT_EQ(outcome.exitCode, 0) << "ip " << line << ": " << outcome.errors;
}

void WriteFile(const std::string& path, const std::string& text)
{
    std::filesystem::create_directories(std::filesystem::path(path).parent_path());
    std::ofstream file(path);
    file << text << std::flush;
    EXPECT_TRUE(file.good()) << path;
}

std::string ReadFile(const std::string& path)
{
    std::ifstream file(path);
    if (!file) {
        return "(none)";
    }
    std::ostringstream text;
    text << file.rdbuf();
    return text.str();
}

void Delete(const std::string& path)
{
    std::filesystem::remove_all(path);
}

std::string IfcfgPath(const std::string& interface)
{
    return "/etc/sysconfig/network-scripts/ifcfg-" + interface;
}

} // namespace contract
