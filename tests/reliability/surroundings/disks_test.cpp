// Disks that take nothing more, under each folder that the library writes to.
#include "host/host.h"
#include "support/figures.h"
#include "surroundings/operations.h"

#include <gtest/gtest.h>

#include <array>
#include <csignal>
#include <filesystem>
#include <fstream>

#include <sys/mount.h>
#include <sys/resource.h>
#include <sys/statvfs.h>
#include <unistd.h>

namespace {

namespace fs = std::filesystem;
using reliability::Operation;
using reliability::Outcome;

/** A disk of its own for a folder, with what the folder holds; gone with this object. */
class Disk {
public:
    Disk(std::string folder, const std::string& options) : m_folder(std::move(folder))
    {
        const fs::path copy = "/copy";
        fs::create_directories(m_folder);
        fs::copy(m_folder, copy, fs::copy_options::recursive);
        EXPECT_EQ(::mount("disk", m_folder.c_str(), "tmpfs", 0, options.c_str()), 0) << m_folder;
        fs::copy(copy, m_folder, fs::copy_options::recursive);
        fs::remove_all(copy);
    }
    Disk(const Disk&) = delete;
    Disk& operator=(const Disk&) = delete;
    ~Disk() { EXPECT_EQ(::umount2(m_folder.c_str(), MNT_DETACH), 0) << m_folder; }

    void FillBytes() const
    {
        std::ofstream file(m_folder + "/.filler", std::ios::binary);
        const std::string block(4096, 'x');
        while (file.write(block.data(), static_cast<std::streamsize>(block.size())).flush()) {
        }
    }
    void FillEntries() const
    {
        struct statvfs status {};
        for (int number = 0; ::statvfs(m_folder.c_str(), &status) == 0 && status.f_ffree > 0;
             ++number) {
            const std::ofstream file(m_folder + "/.filler" + std::to_string(number));
        }
    }
    void MakeReadOnly() const
    {
        EXPECT_EQ(::mount("disk", m_folder.c_str(), "tmpfs", MS_REMOUNT | MS_RDONLY, ""), 0);
    }

private:
    std::string m_folder;
};

struct Trouble {
    const char* name;
    const char* options;
    void (Disk::*cause)() const;
};

constexpr std::array<Trouble, 3> kTroubles = {
    {{"no byte left", "size=64k", &Disk::FillBytes},
     {"no entry left", "nr_inodes=40", &Disk::FillEntries},
     {"read-only", "size=1m", &Disk::MakeReadOnly}}};

constexpr std::array kFolders = {"/usr/vorn/etc/vornovs", "/etc/sysconfig/network-scripts",
                                 "/usr/vorn/etc/vornnetd", "/run/vornovs"};

class Disks : public testing::Test {
protected:
    static void SetUpTestSuite() { reliability::LearnEnds(); }
};

/** @return  whether everything was done all the same. */
bool RunOn(const char* folder, const Trouble& trouble, const Operation& operation)
{
    reliability::StartWith(operation.start);
    Outcome outcome;
    {
        const Disk disk(folder, trouble.options);
        (disk.*trouble.cause)();
        outcome = reliability::Run(operation);
        for (const auto& entry : fs::directory_iterator(folder)) {
            const std::string name = entry.path().filename();
            EXPECT_FALSE(name.starts_with(".vornovs") || name.find(".new") != std::string::npos)
                << name << " is left";
        }
    }
    std::erase_if(outcome.files, [](const auto& file) {
        return file.first.find("/.filler") != std::string::npos;
    });
    reliability::ExpectSound(operation, outcome);
    return reliability::IsWhole(operation, outcome);
}

TEST_F(Disks, ThatTakeNothingMoreLoseAndTearNothing)
{
    int tried = 0;
    int undone = 0;
    for (const char* const folder : kFolders) {
        for (const Trouble& trouble : kTroubles) {
            for (const Operation& operation : reliability::Operations()) {
                SCOPED_TRACE(operation.name + ", " + folder + " is a disk with " + trouble.name);
                undone += RunOn(folder, trouble, operation) ? 0 : 1;
                ++tried;
            }
        }
    }
    EXPECT_GT(undone, tried / 4) << "the disks took it";
    reliability::Figure(std::to_string(tried) +
                        " surroundings with a disk that is full, without entries or read-only: " +
                        std::to_string(undone) + " left something undone, none lost anything");
}

/** A client that may write that many bytes into a file, and is ended for more or only told so. */
void LimitFiles(rlim_t size, bool ended)
{
    const struct rlimit limit = {size, RLIM_INFINITY};
    EXPECT_EQ(::setrlimit(RLIMIT_FSIZE, &limit), 0);
    (void)::signal(SIGXFSZ, ended ? SIG_DFL : SIG_IGN);
}

TEST_F(Disks, ThatAClientMayNotWriteToLoseAndTearNothing)
{
    const std::string wasEnded = "the client died with status " + std::to_string(SIGXFSZ) + "\n";
    int tried = 0;
    for (const bool ended : {false, true}) {
        for (const rlim_t size : {0UL, 5UL, 40UL, 80UL}) {
            for (const Operation& operation : reliability::Operations()) {
                SCOPED_TRACE(operation.name + " with files of " + std::to_string(size) +
                             (ended ? " bytes or the client ends" : " bytes"));
                reliability::StartWith(operation.start);
                Outcome outcome = reliability::Run(operation, [&] { LimitFiles(size, ended); });
                if (ended && outcome.findings == wasEnded) {
                    // Dead as if it had been killed: what it wrote beside a file stays.
                    std::erase_if(outcome.files, [](const auto& file) {
                        return file.first.find(".new") != std::string::npos ||
                               file.first.find("/.vornovs") != std::string::npos;
                    });
                    outcome.findings.clear();
                    outcome.result = *operation.documented.begin();
                    outcome.log.emplace_back("dead");
                }
                reliability::ExpectSound(operation, outcome);
                ++tried;
            }
        }
    }
    reliability::Figure(std::to_string(tried) +
                        " surroundings with a client that may only write small files");
}

} // namespace
