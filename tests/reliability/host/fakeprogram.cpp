/**
 * Stands for the programs of the host. It writes down how it was called, and does what the file
 * "/run/fake/NAME" says, NAME being its own:
 *
 *   exit N    ends with that status, after "saying" what follows the number, if anything does
 *   kill N    ends by that signal
 *   hang      ends by the limit that the environment sets for the switch's tool, or never
 *   print N   prints N letters and ends with 0
 *
 * Without such a file it is a switch's tool whose bridges are those that have configuration files,
 * a network program to which all is well, or, as "act", does what its arguments say in these words.
 * "act witness" prints what it was given: environment, descriptors and signals.
 */
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <cstring>

#include <dirent.h>
#include <fcntl.h>
#include <sys/resource.h>
#include <unistd.h>

namespace {

constexpr char kFolder[] = "/run/fake/";
constexpr char kBridges[] = "ifcfg-ovs_";
constexpr char kIfcfg[] = "ifcfg-";

/** One record: the number of arguments, then the length of each and its bytes. */
void Record(int count, char** arguments)
{
    char* text = nullptr;
    size_t size = 0;
    FILE* const stream = open_memstream(&text, &size);
    (void)std::fprintf(stream, "%d\n", count);
    for (int index = 0; index < count; ++index) {
        (void)std::fprintf(stream, "%zu\n", std::strlen(arguments[index]));
        (void)std::fputs(arguments[index], stream);
    }
    (void)std::fclose(stream);
    const int file = ::open("/run/fake/calls", O_WRONLY | O_APPEND | O_CLOEXEC);
    if (file >= 0 && ::write(file, text, size) != static_cast<ssize_t>(size)) {
        ::_exit(99);
    }
    std::free(text);
}

void Print(long letters)
{
    for (long index = 0; index < letters; ++index) {
        (void)std::putchar(static_cast<int>('a' + index % 26));
    }
}

int Act(const char* verb, const char* value)
{
    const long number = value == nullptr ? 0 : std::strtol(value, nullptr, 10);
    if (std::strcmp(verb, "kill") == 0) {
        (void)::kill(::getpid(), static_cast<int>(number));
    }
    if (std::strcmp(verb, "hang") == 0) {
        const char* const limit = std::getenv("OVS_CTL_TIMEOUT");
        (void)::alarm(limit == nullptr ? 0 : static_cast<unsigned>(std::atoi(limit)));
        for (;;) {
            ::pause();
        }
    }
    if (std::strcmp(verb, "print") == 0) {
        Print(number);
        return 0;
    }
    const char* const text = value == nullptr ? nullptr : std::strchr(value, ' ');
    if (text != nullptr) {
        (void)std::puts(text + 1);
    }
    return static_cast<int>(number);
}

int Witness()
{
    for (char** variable = environ; *variable != nullptr; ++variable) {
        (void)std::puts(*variable);
    }
    for (int number = 0; number < 20000; ++number) {
        if (::fcntl(number, F_GETFD) >= 0) {
            (void)std::printf("descriptor %d\n", number);
        }
    }
    char line[256];
    FILE* const status = std::fopen("/proc/self/status", "re");
    while (status != nullptr && std::fgets(line, sizeof line, status) != nullptr) {
        if (std::strncmp(line, "SigBlk:", 7) == 0 || std::strncmp(line, "SigIgn:", 7) == 0) {
            // The C library keeps two signals to itself.
            constexpr unsigned long kInternal = 0x180000000;
            (void)std::printf("%.7s %lx\n", line, std::strtoul(line + 8, nullptr, 16) & ~kInternal);
        }
    }
    (void)std::puts(::getcwd(line, sizeof line));
    struct rlimit limit {};
    (void)::getrlimit(RLIMIT_FSIZE, &limit);
    (void)std::puts(limit.rlim_cur == RLIM_INFINITY ? "files of any size" : "files too small");
    (void)::getrlimit(RLIMIT_NOFILE, &limit);
    (void)std::puts(limit.rlim_cur >= 1024 ? "enough descriptors" : "few descriptors");
    return 0;
}

int ListBridges()
{
    DIR* const folder = ::opendir("/etc/sysconfig/network-scripts");
    for (const dirent* entry = nullptr;
         folder != nullptr && (entry = ::readdir(folder)) != nullptr;) {
        if (std::strncmp(entry->d_name, kBridges, sizeof kBridges - 1) == 0) {
            (void)std::puts(entry->d_name + sizeof kIfcfg - 1);
        }
    }
    return 0;
}

/** Does what the file of that name says. @return whether there is one. */
bool Obey(const char* name, int& status)
{
    char path[128];
    char words[256] = "";
    (void)std::snprintf(path, sizeof path, "%s%s", kFolder, name);
    FILE* const file = std::fopen(path, "re");
    if (file == nullptr || std::fgets(words, sizeof words, file) == nullptr) {
        return false;
    }
    words[std::strcspn(words, "\n")] = '\0';
    char* const value = std::strchr(words, ' ');
    if (value != nullptr) {
        *value = '\0';
    }
    status = Act(words, value == nullptr ? nullptr : value + 1);
    return true;
}

} // namespace

int main(int count, char** arguments)
{
    const char* const slash = std::strrchr(arguments[0], '/');
    const char* const name = slash == nullptr ? arguments[0] : slash + 1;
    const char* const verb = count > 1 ? arguments[1] : "";
    int status = 0;
    if (std::strcmp(name, "act") == 0) {
        return std::strcmp(verb, "witness") == 0 ? Witness()
                                                 : Act(verb, count > 2 ? arguments[2] : nullptr);
    }
    Record(count, arguments);
    if (Obey(name, status)) {
        return status;
    }
    if (std::strcmp(verb, "list-br") == 0) {
        return ListBridges();
    }
    if (std::strcmp(verb, "get") == 0) {
        (void)std::puts("[]");
    }
    return 0;
}
