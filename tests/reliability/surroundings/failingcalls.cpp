#include "surroundings/failingcalls.h"

#include <cerrno>
#include <cstddef>
#include <cstdio>

#include <dlfcn.h>
#include <sys/stat.h>
#include <unistd.h>

#define TAKES_THE_PLACE __attribute__((visibility("default")))

namespace reliability {
namespace {

bool g_counting = false;
int g_calls = 0;
int g_first = 0;
int g_error = 0;
bool g_always = false;

bool Fails()
{
    if (!g_counting) {
        return false;
    }
    ++g_calls;
    const bool fails = g_first != 0 && (g_always ? g_calls >= g_first : g_calls == g_first);
    if (fails) {
        errno = g_error;
    }
    return fails;
}

/** The C library's own. */
template <typename Result, typename... Arguments>
Result Call(const char* name, Arguments... arguments)
{
    return reinterpret_cast<Result (*)(Arguments...)>(::dlsym(RTLD_NEXT, name))(arguments...);
}

} // namespace

void CountFileCalls()
{
    g_counting = true;
    g_calls = 0;
    g_first = 0;
}

int FileCalls()
{
    return g_calls;
}

void FailFileCalls(int first, int error, bool always)
{
    CountFileCalls();
    g_first = first;
    g_error = error;
    g_always = always;
}

} // namespace reliability

using reliability::Call;
using reliability::Fails;

extern "C" {

TAKES_THE_PLACE ssize_t write(int descriptor, const void* data, size_t size)
{
    return Fails() ? -1 : Call<ssize_t>("write", descriptor, data, size);
}

TAKES_THE_PLACE int fsync(int descriptor)
{
    return Fails() ? -1 : Call<int>("fsync", descriptor);
}

TAKES_THE_PLACE int rename(const char* from, const char* to) noexcept
{
    return Fails() ? -1 : Call<int>("rename", from, to);
}

TAKES_THE_PLACE int unlink(const char* path) noexcept
{
    return Fails() ? -1 : Call<int>("unlink", path);
}

TAKES_THE_PLACE int mkdir(const char* path, mode_t mode) noexcept
{
    return Fails() ? -1 : Call<int>("mkdir", path, mode);
}

TAKES_THE_PLACE int mkostemp(char* path, int flags)
{
    return Fails() ? -1 : Call<int>("mkostemp", path, flags);
}

TAKES_THE_PLACE int fchmod(int descriptor, mode_t mode) noexcept
{
    return Fails() ? -1 : Call<int>("fchmod", descriptor, mode);
}

TAKES_THE_PLACE int fchown(int descriptor, uid_t user, gid_t group) noexcept
{
    return Fails() ? -1 : Call<int>("fchown", descriptor, user, group);
}
}
