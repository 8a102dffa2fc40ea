// A client as large as the machine lets it be.
#include "host/client.h"
#include "host/host.h"
#include "support/figures.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <chrono>
#include <cstdlib>

#include <sys/mman.h>
#include <vornplatform/core.h>

namespace {

using reliability::Findings;

constexpr size_t kGigabyte = size_t{1} << 30;
constexpr size_t kPage = 4096;

/** Memory that can be had without taking it from others. */
size_t AvailableMemory()
{
    const std::string text = reliability::ReadFile("/proc/meminfo");
    const size_t at = text.find("MemAvailable:");
    return at == std::string::npos ? 0 : std::strtoul(text.c_str() + at + 13, nullptr, 10) * 1024;
}

/** 8 GB, or half of what there is. */
size_t SizeOfClient()
{
    return std::min(8 * kGigabyte, AvailableMemory() / 2 / kPage * kPage);
}

void Fill(size_t size, Findings& findings)
{
    void* const memory = ::mmap(nullptr, size, PROT_READ | PROT_WRITE,
                                MAP_PRIVATE | MAP_ANONYMOUS | MAP_NORESERVE, -1, 0);
    findings.Expect(memory != MAP_FAILED, "no memory");
    if (memory == MAP_FAILED) {
        return;
    }
    // Small pages, as a client's heap has after a while: copying their tables would take a second.
    (void)::madvise(memory, size, MADV_NOHUGEPAGE);
    findings.Expect(::madvise(memory, size, MADV_POPULATE_WRITE) == 0, "memory is not resident");
}

TEST(LargeClient, IsServedInTime)
{
    using Milliseconds = std::chrono::duration<double, std::milli>;
    const size_t size = SizeOfClient();
    EXPECT_EQ(reliability::RunClient(
                  {},
                  [&](Findings& findings) {
                      Fill(size, findings);
                      Milliseconds least = std::chrono::hours(1);
                      for (int call = 0; call < 10; ++call) {
                          const auto begin = std::chrono::steady_clock::now();
                          findings.Expect(VLIBCExec(reliability::kActor, "exit", "0", nullptr) == 0,
                                          "a program failed");
                          findings.Expect(VLIBCExec(reliability::kActor, "exit", "7", nullptr) < 0,
                                          "a failed program succeeded");
                          least = std::min<Milliseconds>(least,
                                                         std::chrono::steady_clock::now() - begin);
                      }
                      // Copying the page tables alone takes some 30 ms a gigabyte, twice.
                      findings.Expect(least.count() < 100, "two programs took, in milliseconds,",
                                      std::to_string(least.count()).c_str());
                  }),
              "");
    const bool whole = size == 8 * kGigabyte;
    reliability::Figure("1 client with " + std::to_string(size / (kGigabyte / 1024)) +
                        " MB resident served in time" +
                        (whole ? "" : ", smaller than the 8 GB it should have: memory is short"));
}

} // namespace
