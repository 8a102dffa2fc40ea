#include "support/filecalls.h"

#include <gtest/gtest.h>

#include <array>
#include <cerrno>
#include <map>

#include <dlfcn.h>
#include <linux/capability.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <unistd.h>

namespace unit {
namespace {

struct Failure {
    int error;
    int nth;
    int seen;
};

struct State {
    std::map<std::string, Failure> failures;
    std::vector<std::string> calls;
    bool singleBytes = false;
};

State* g_state = nullptr;

bool Fails(const char* function)
{
    if (g_state == nullptr) {
        return false;
    }
    const auto found = g_state->failures.find(function);
    if (found == g_state->failures.end()) {
        return false;
    }
    Failure& failure = found->second;
    ++failure.seen;
    if (failure.nth != 0 && failure.nth != failure.seen) {
        return false;
    }
    errno = failure.error;
    return true;
}

std::string BaseName(const std::string& path)
{
    return path.substr(path.rfind('/') + 1);
}

std::string NameOfDescriptor(int descriptor)
{
    const std::string link = "/proc/self/fd/" + std::to_string(descriptor);
    std::array<char, 4096> target{};
    const ssize_t size = readlink(link.c_str(), target.data(), target.size() - 1);
    return size < 0 ? link : BaseName(target.data());
}

template <typename Function>
Function Next(const char* name)
{
    return reinterpret_cast<Function>(dlsym(RTLD_NEXT, name));
}

/** Replaces the effective capabilities' low word and gives the old one. */
unsigned int SetCapabilities(unsigned int keep, unsigned int add)
{
    __user_cap_header_struct header{_LINUX_CAPABILITY_VERSION_3, 0};
    std::array<__user_cap_data_struct, _LINUX_CAPABILITY_U32S_3> data{};
    EXPECT_EQ(syscall(SYS_capget, &header, data.data()), 0);
    const unsigned int old = data[0].effective;
    data[0].effective = (old & keep) | add;
    EXPECT_EQ(syscall(SYS_capset, &header, data.data()), 0);
    return old;
}

} // namespace

FileCalls::FileCalls()
{
    g_state = new State;
}

FileCalls::~FileCalls()
{
    delete g_state;
    g_state = nullptr;
}

void FileCalls::Fail(const std::string& function, int error, int nth)
{
    g_state->failures[function] = {error, nth, 0};
}

void FileCalls::WriteSingleBytes()
{
    g_state->singleBytes = true;
}

const std::vector<std::string>& FileCalls::List() const
{
    return g_state->calls;
}

ScopedWithoutOverride::ScopedWithoutOverride()
    : m_effective(SetCapabilities(~((1U << CAP_DAC_OVERRIDE) | (1U << CAP_DAC_READ_SEARCH)), 0))
{
}

ScopedWithoutOverride::~ScopedWithoutOverride()
{
    (void)SetCapabilities(~0U, m_effective);
}

} // namespace unit

extern "C" {

int fsync(int descriptor)
{
    if (unit::g_state != nullptr) {
        unit::g_state->calls.push_back("fsync " + unit::NameOfDescriptor(descriptor));
    }
    return unit::Fails("fsync") ? -1 : unit::Next<int (*)(int)>("fsync")(descriptor);
}

int rename(const char* from, const char* to) noexcept
{
    if (unit::g_state != nullptr) {
        unit::g_state->calls.push_back("rename " + unit::BaseName(from) + " " + unit::BaseName(to));
    }
    return unit::Fails("rename")
               ? -1
               : unit::Next<int (*)(const char*, const char*)>("rename")(from, to);
}

int unlink(const char* path) noexcept
{
    if (unit::g_state != nullptr) {
        unit::g_state->calls.push_back("unlink " + unit::BaseName(path));
    }
    return unit::Fails("unlink") ? -1 : unit::Next<int (*)(const char*)>("unlink")(path);
}

int fchown(int descriptor, uid_t user, gid_t group) noexcept
{
    return unit::Fails("fchown")
               ? -1
               : unit::Next<int (*)(int, uid_t, gid_t)>("fchown")(descriptor, user, group);
}

int fchmod(int descriptor, mode_t mode) noexcept
{
    return unit::Fails("fchmod") ? -1
                                 : unit::Next<int (*)(int, mode_t)>("fchmod")(descriptor, mode);
}

ssize_t read(int descriptor, void* data, size_t size)
{
    return unit::Fails("read")
               ? -1
               : unit::Next<ssize_t (*)(int, void*, size_t)>("read")(descriptor, data, size);
}

ssize_t write(int descriptor, const void* data, size_t size)
{
    if (unit::Fails("write")) {
        return -1;
    }
    const bool single = unit::g_state != nullptr && unit::g_state->singleBytes && size > 1;
    return unit::Next<ssize_t (*)(int, const void*, size_t)>("write")(descriptor, data,
                                                                      single ? 1 : size);
}
}
