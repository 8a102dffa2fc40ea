#include "support/filecalls.h"

#include "recordingplatform/recordingplatform.h"

#include <gtest/gtest.h>

#include <array>
#include <cerrno>
#include <cstdarg>
#include <map>
#include <utility>

#include <dlfcn.h>
#include <fcntl.h>
#include <linux/capability.h>
#include <sys/file.h>
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
    std::function<int(const std::string&)> before;
    std::function<void()> after;
    std::map<std::string, Failure> failures;
    std::vector<std::string> calls;
    bool singleBytes = false;
};

State* g_state = nullptr;

/** Notes a call for List(). */
template <typename Text>
void Note(const Text& text)
{
    if (g_state != nullptr) {
        const harness::HarnessAllocations guard;
        g_state->calls.push_back(text());
    }
}

bool Fails(const char* function)
{
    if (g_state == nullptr) {
        return false;
    }
    const harness::HarnessAllocations guard;
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

std::string PathOfDescriptor(int descriptor)
{
    const std::string link = "/proc/self/fd/" + std::to_string(descriptor);
    std::array<char, 4096> target{};
    const ssize_t size = readlink(link.c_str(), target.data(), target.size() - 1);
    return size < 0 ? link : target.data();
}

std::string NameOfDescriptor(int descriptor)
{
    return BaseName(PathOfDescriptor(descriptor));
}

/** A call of the library's that is being watched, or one that is not. */
class Watched {
public:
    Watched(const char* function, const std::function<std::string()>& files)
        : m_watched(g_state != nullptr && g_state->before && !harness::HarnessAllocations::Active())
    {
        if (m_watched) {
            const harness::HarnessAllocations guard;
            m_error = g_state->before(std::string(function) + " " + files());
        }
    }
    ~Watched()
    {
        const harness::HarnessAllocations guard;
        const int error = errno;
        if (m_watched && g_state->after) {
            g_state->after();
        }
        errno = error;
    }
    Watched(const Watched&) = delete;
    Watched& operator=(const Watched&) = delete;

    /** Whether it is to fail; errno says with what. */
    [[nodiscard]] bool Fails() const
    {
        if (m_error > 0) {
            errno = m_error;
        }
        return m_error > 0;
    }
    [[nodiscard]] bool IsShort() const { return m_error == FileCalls::kShortWrite; }

private:
    bool m_watched;
    int m_error = 0;
};

const char* WayOfOpening(int flags)
{
    if ((flags & O_TRUNC) != 0) {
        return "open-empty";
    }
    if ((flags & O_CREAT) != 0) {
        return "open-new";
    }
    if ((flags & O_DIRECTORY) == O_DIRECTORY) {
        return "open-folder";
    }
    return (flags & O_ACCMODE) == O_RDONLY ? "open-read" : "open-write";
}

/** The C library's own function. */
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

void FileCalls::Watch(std::function<int(const std::string& call)> before,
                      std::function<void()> after)
{
    g_state->before = std::move(before);
    g_state->after = std::move(after);
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

namespace {

using unit::Next;

} // namespace

extern "C" {

// NOLINTNEXTLINE(cert-dcl50-cpp): declared so by the C library
int open(const char* path, int flags, ...)
{
    va_list arguments;
    va_start(arguments, flags);
    const mode_t mode = (flags & O_CREAT) != 0 ? va_arg(arguments, mode_t) : 0;
    va_end(arguments);
    const unit::Watched watched(unit::WayOfOpening(flags), [&] { return path; });
    return watched.Fails() ? -1 : Next<int (*)(const char*, int, ...)>("open")(path, flags, mode);
}

int mkdir(const char* path, mode_t mode) noexcept
{
    const unit::Watched watched("mkdir", [&] { return path; });
    return watched.Fails() ? -1 : Next<int (*)(const char*, mode_t)>("mkdir")(path, mode);
}

int ftruncate(int descriptor, off_t size) noexcept
{
    const unit::Watched watched("ftruncate", [&] { return unit::PathOfDescriptor(descriptor); });
    return watched.Fails() ? -1 : Next<int (*)(int, off_t)>("ftruncate")(descriptor, size);
}

int flock(int descriptor, int operation) noexcept
{
    const unit::Watched watched("flock", [&] { return unit::PathOfDescriptor(descriptor); });
    return watched.Fails() ? -1 : Next<int (*)(int, int)>("flock")(descriptor, operation);
}

int fstat(int descriptor, struct stat* status) noexcept
{
    const unit::Watched watched("fstat", [&] { return unit::PathOfDescriptor(descriptor); });
    return watched.Fails() ? -1 : Next<int (*)(int, struct stat*)>("fstat")(descriptor, status);
}

int lstat(const char* path, struct stat* status) noexcept
{
    const unit::Watched watched("lstat", [&] { return path; });
    return watched.Fails() ? -1 : Next<int (*)(const char*, struct stat*)>("lstat")(path, status);
}

int fsync(int descriptor)
{
    const unit::Watched watched("fsync", [&] { return unit::PathOfDescriptor(descriptor); });
    unit::Note([&] { return "fsync " + unit::NameOfDescriptor(descriptor); });
    return watched.Fails() || unit::Fails("fsync") ? -1 : Next<int (*)(int)>("fsync")(descriptor);
}

int rename(const char* from, const char* to) noexcept
{
    const unit::Watched watched("rename", [&] { return std::string(from) + " " + to; });
    unit::Note([&] { return "rename " + unit::BaseName(from) + " " + unit::BaseName(to); });
    return watched.Fails() || unit::Fails("rename")
               ? -1
               : Next<int (*)(const char*, const char*)>("rename")(from, to);
}

int unlink(const char* path) noexcept
{
    const unit::Watched watched("unlink", [&] { return path; });
    unit::Note([&] { return "unlink " + unit::BaseName(path); });
    return watched.Fails() || unit::Fails("unlink") ? -1
                                                    : Next<int (*)(const char*)>("unlink")(path);
}

int fchown(int descriptor, uid_t user, gid_t group) noexcept
{
    const unit::Watched watched("fchown", [&] { return unit::PathOfDescriptor(descriptor); });
    return watched.Fails() || unit::Fails("fchown")
               ? -1
               : Next<int (*)(int, uid_t, gid_t)>("fchown")(descriptor, user, group);
}

int fchmod(int descriptor, mode_t mode) noexcept
{
    const unit::Watched watched("fchmod", [&] { return unit::PathOfDescriptor(descriptor); });
    return watched.Fails() || unit::Fails("fchmod")
               ? -1
               : Next<int (*)(int, mode_t)>("fchmod")(descriptor, mode);
}

ssize_t read(int descriptor, void* data, size_t size)
{
    const unit::Watched watched("read", [&] { return unit::PathOfDescriptor(descriptor); });
    return watched.Fails() || unit::Fails("read")
               ? -1
               : Next<ssize_t (*)(int, void*, size_t)>("read")(descriptor, data, size);
}

ssize_t write(int descriptor, const void* data, size_t size)
{
    const unit::Watched watched("write", [&] { return unit::PathOfDescriptor(descriptor); });
    if (watched.Fails() || unit::Fails("write")) {
        return -1;
    }
    const bool single =
        watched.IsShort() || (unit::g_state != nullptr && unit::g_state->singleBytes);
    return Next<ssize_t (*)(int, const void*, size_t)>("write")(descriptor, data,
                                                                single && size > 1 ? 1 : size);
}
}
