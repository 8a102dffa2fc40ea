#include "faults/promises.h"

#include <algorithm>
#include <sstream>

#include <syslog.h>

namespace reliability {

namespace {

using testing::AnyOf;
using testing::Contains;
using testing::IsEmpty;

const unit::Names kKnown{"client", "other", "eth0", "eth1",  "eth2",
                         "eth3",   "eth4",  "eth9", "bond0", "eth1.10"};

std::vector<std::string> Lines(const std::string& text)
{
    std::istringstream stream(text);
    std::vector<std::string> lines;
    for (std::string line; std::getline(stream, line);) {
        lines.push_back(line);
    }
    return lines;
}

long Count(const Run& run, const std::string& function)
{
    return std::count_if(run.calls.begin(), run.calls.end(), [&](const std::string& call) {
        return call.substr(0, call.find(' ')) == function;
    });
}

/** Names that were ever there, sorted, each with its line end. */
void ExpectWholeLists()
{
    for (const std::string& name : unit::ListFolder(unit::kStateFolder)) {
        EXPECT_THAT(name, AnyOf("ovs_reg.conf", "ovs_interface.conf", "ovs_ignore.conf"));
        const std::string text =
            unit::ReadFile(std::string(unit::kStateFolder) + "/" + name).value_or("");
        const std::vector<std::string> lines = Lines(text);
        EXPECT_TRUE(text.empty() || text.back() == '\n') << name << ": " << text;
        EXPECT_TRUE(std::is_sorted(lines.begin(), lines.end())) << name << ": " << text;
        for (const std::string& line : lines) {
            EXPECT_THAT(kKnown, Contains(line)) << name;
        }
    }
}

/** Whole lines, and every setting of the host in some file. */
void ExpectWholeFiles(const Scene& scene)
{
    const unit::Files files = unit::ReadFiles();
    std::string all;
    for (const auto& [name, text] : files) {
        EXPECT_TRUE(name.starts_with("ifcfg-")) << name;
        EXPECT_TRUE(text.empty() || text.back() == '\n') << name << ": " << text;
        for (const std::string& line : Lines(text)) {
            EXPECT_NE(line.find('='), std::string::npos) << name << ": " << text;
        }
        all += text;
    }
    for (const std::string& setting : scene.Settings()) {
        EXPECT_NE(all.find(setting + "\n"), std::string::npos) << setting << " is lost";
    }
}

/** The last thing that the network is told is to start. */
bool IsLeftStopped(const Run& run)
{
    bool stopped = false;
    for (const std::string& call : run.calls) {
        const bool script = call.find(" /etc/rc.network ") != std::string::npos;
        stopped = script ? call.find(" /etc/rc.network stop") != std::string::npos : stopped;
    }
    return stopped;
}

const Fatal* FatalAt(const Scenario& scenario, const Point& point)
{
    const auto found =
        std::find_if(scenario.fatal.begin(), scenario.fatal.end(), [&](const Fatal& fatal) {
            const bool anyOperation = fatal.point.starts_with("/");
            return anyOperation ? point.file && point.text.find(fatal.point) != std::string::npos
                                : point.text.starts_with(fatal.point);
        });
    return found == scenario.fatal.end() ? nullptr : &*found;
}

void ExpectResult(const Scenario& scenario, const Run& run, const Fault& fault)
{
    std::vector<int> results = scenario.failures;
    results.push_back(scenario.success);
    EXPECT_THAT(results, Contains(run.result));
    if (fault.allocation != 0) {
        return;
    }
    const Fatal* const fatal = FatalAt(scenario, run.points[fault.point]);
    const bool depends = fault.way.then == Then::kAnswer || fault.way.then == Then::kTold ||
                         (fatal != nullptr && fatal->result == kDepends);
    if (!depends && !fault.andAlike) {
        const bool passes = fatal == nullptr || fault.way.then == Then::kSilent;
        EXPECT_EQ(run.result, passes ? scenario.success : fatal->result);
    }
    const bool told = std::any_of(run.log.begin(), run.log.end(),
                                  [](const auto& line) { return line.priority == LOG_ERR; });
    const bool failure = fault.way.then != Then::kAnswer && fault.way.then != Then::kUnsaid;
    EXPECT_TRUE(!failure || run.result == scenario.success || scenario.silent || told)
        << "no line in the log explains " << run.result;
}

} // namespace

void ExpectNothingLost(const Scenario& scenario, const Scene& scene, const Run& run)
{
    EXPECT_FALSE(run.threw) << "an exception left the library";
    EXPECT_THAT(run.openHandles, IsEmpty());
    EXPECT_THAT(run.leftDescriptors, IsEmpty());
    EXPECT_FALSE(run.leftChild) << "a child is left";
    EXPECT_GE(Count(run, "VLIBCFileLockTimeByFile"), Count(run, "VLIBCFileUnlockByFile"));
    EXPECT_GE(Count(run, "VLIBCFileLock"), Count(run, "VLIBCFileUnlock"));
    EXPECT_TRUE(scenario.mayStayStopped || !IsLeftStopped(run)) << "the network is left stopped";
    ExpectWholeLists();
    ExpectWholeFiles(scene);
}

void ExpectWordsAndResult(const Scenario& scenario, const Run& clean, const Run& run,
                          const Fault& fault)
{
    ExpectResult(scenario, run, fault);
    if (fault.allocation != 0) {
        return;
    }
    ASSERT_LE(run.logBefore, clean.log.size());
    const auto before = static_cast<std::ptrdiff_t>(run.logBefore);
    EXPECT_TRUE(std::equal(run.log.begin(), run.log.begin() + before, clean.log.begin()))
        << "the log is another one before anything failed";
    const Way& way = fault.way;
    if (way.then == Then::kLine || way.then == Then::kTold) {
        ASSERT_GT(run.log.size(), run.logBefore) << "not told: " << way.text;
        EXPECT_THAT(run.log[run.logBefore].text, testing::StartsWith(way.text));
    } else if (!fault.andAlike && (way.then == Then::kSilent || way.then == Then::kUnsaid)) {
        EXPECT_EQ(run.log, clean.log);
    } else if (way.then == Then::kError) {
        ASSERT_GT(run.calls.size(), run.callsBefore);
        EXPECT_EQ(run.calls[run.callsBefore], way.text);
    }
}

} // namespace reliability
