#include "clients/traits.h"

#include "host/host.h"
#include "reapers/reapers.h"

#include <algorithm>
#include <csignal>
#include <cstdlib>
#include <filesystem>
#include <stdexcept>

#include <fcntl.h>
#include <sys/resource.h>
#include <unistd.h>

namespace reliability {
namespace {

namespace fs = std::filesystem;

constexpr char kPlanted[] = "/tmp/planted";
constexpr char kMark[] = "/tmp/planted/ran";

void Check(bool done, const char* what)
{
    if (!done) {
        throw std::runtime_error(what);
    }
}

void OnChildEnd(void (*handler)(int), int flags)
{
    struct sigaction action {};
    action.sa_handler = handler;
    action.sa_flags = flags;
    Check(::sigaction(SIGCHLD, &action, nullptr) == 0, "sigaction");
}

void BlockAll()
{
    sigset_t all;
    (void)::sigfillset(&all);
    Check(::sigprocmask(SIG_SETMASK, &all, nullptr) == 0, "sigprocmask");
}

void IgnoreAll()
{
    for (int signal = 1; signal < NSIG; ++signal) {
        if (signal != SIGCHLD) {
            (void)::signal(signal, SIG_IGN); // some cannot be
        }
    }
}

void SetLimit(__rlimit_resource_t resource, rlim_t value)
{
    struct rlimit limit {};
    Check(::getrlimit(resource, &limit) == 0, "getrlimit");
    limit.rlim_cur = value;
    limit.rlim_max = std::max(limit.rlim_max, value);
    Check(::setrlimit(resource, &limit) == 0, "setrlimit");
}

void CloseStandard()
{
    for (int number = 0; number < 3; ++number) {
        (void)::close(number);
    }
}

/** As careless clients do it: a program that is started has them all. */
int OpenInheritable()
{
    return ::open("/dev/null", O_RDWR); // NOLINT(android-cloexec-open)
}

void OpenMany()
{
    constexpr int kMany = 10000;
    SetLimit(RLIMIT_NOFILE, kMany + 200);
    int opened = 0;
    while (opened < kMany && OpenInheritable() >= 0) {
        ++opened;
    }
    Check(opened == kMany, "10,000 descriptors cannot be opened");
}

void Set(const char* name, const std::string& value)
{
    Check(::setenv(name, value.c_str(), 1) == 0, "setenv");
}

void TakeHostileEnvironment()
{
    const std::string folder = kPlanted;
    for (const char* const name : {"PATH", "LD_LIBRARY_PATH", "OVS_RUNDIR", "OVS_SYSCONFDIR",
                                   "OVS_DBDIR", "OVS_PKGDATADIR", "HOME", "CDPATH"}) {
        Set(name, folder);
    }
    for (const char* const name : {"BASH_ENV", "ENV"}) {
        Set(name, folder + "/sh");
    }
    for (const char* const name : {"LD_PRELOAD", "LD_AUDIT"}) {
        Set(name, folder + "/planted.so");
    }
    SetLimit(RLIMIT_FSIZE, 1 << 20);
    Set("IFS", "/");
    Set("OVS_CTL_TIMEOUT", "1");
    Set("LC_ALL", "de_DE.UTF-8");
    Set("TMPDIR", folder + "/missing");
    Set("POSIXLY_CORRECT", "1");
    Set("VORNOVS_SCRIPT", "alone");
    Set("MALLOC_PERTURB_", "165");
}

} // namespace

std::vector<Trait> ChildTraits()
{
    return {{"leaves SIGCHLD alone", [] { OnChildEnd(SIG_DFL, 0); }},
            {"ignores SIGCHLD", [] { OnChildEnd(SIG_IGN, 0); }},
            {"wants no zombies", [] { OnChildEnd(SIG_DFL, SA_NOCLDWAIT); }},
            {"reaps in a handler", [] { OnChildEnd(harness::ReapAll, 0); }},
            {"reaps in a thread", harness::ReapForEver}};
}

std::vector<Trait> SignalTraits()
{
    return {{"leaves its signals alone", [] {}},
            {"blocks all signals", BlockAll},
            {"ignores all signals", IgnoreAll}};
}

std::vector<Trait> DescriptorTraits()
{
    return {{"has ordinary descriptors", [] {}},
            {"has 0 to 2 closed", CloseStandard},
            {"has 10,000 open", OpenMany},
            {"has no descriptor left", [] { (void)LeaveDescriptors(0); }}};
}

std::vector<Trait> EnvironmentTraits()
{
    return {{"has an ordinary environment", [] {}},
            {"has a hostile environment", TakeHostileEnvironment}};
}

void Plant()
{
    const std::string folder = kPlanted;
    for (const char* const program : {"sh", "cp", "env", "ovs-vsctl", "rc.network", "vornrun", "ip",
                                      "act", "vornnetdtool", "true"}) {
        WriteFile(folder + "/" + program, "#!/bin/sh\n: >/tmp/planted/ran\nexit 0\n", 0755);
    }
    for (const char* const library : {"planted.so", "libc.so.6", "libstdc++.so.6", "libm.so.6",
                                      "libgcc_s.so.1", "libacl.so.1", "libselinux.so.1"}) {
        fs::copy_file(PLANTED_LIBRARY, folder + "/" + library,
                      fs::copy_options::overwrite_existing);
    }
    fs::remove(kMark);
}

bool PlantedRan()
{
    return fs::exists(kMark);
}

std::vector<int> LeaveDescriptors(int count)
{
    constexpr int kLimit = 96;
    SetLimit(RLIMIT_NOFILE, kLimit);
    std::vector<int> descriptors;
    for (int opened = 0; (opened = OpenInheritable()) >= 0;) {
        descriptors.push_back(opened);
    }
    for (int closed = 0; closed < count; ++closed) {
        (void)::close(descriptors.back());
        descriptors.pop_back();
    }
    return descriptors;
}

} // namespace reliability
