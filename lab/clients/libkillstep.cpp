// Kills the program that it is loaded into (LD_PRELOAD) right before a chosen step of the library.
//
// A step is a call of one of the platform's functions below, counted from 1. KILL_AT is the number
// of the step (0: none), KILL_LOG a file that receives a line for every step before it is taken:
// its number, its name, and the milliseconds since the machine was started.
#include <csignal>
#include <cstdlib>
#include <ctime>
#include <dlfcn.h>
#include <fcntl.h>
#include <string>
#include <unistd.h>

namespace {

int g_steps = 0;

void Note(const std::string& line)
{
    const char* const path = std::getenv("KILL_LOG");
    if (path == nullptr) {
        return;
    }
    const int file = ::open(path, O_WRONLY | O_CREAT | O_APPEND | O_CLOEXEC, 0644);
    if (file >= 0) {
        if (::write(file, line.data(), line.size()) < 0) {
            std::abort();
        }
        ::close(file);
    }
}

} // namespace

// Returns the function that the caller meant.
extern "C" void* LabStep(const char* name)
{
    ++g_steps;
    timespec now{};
    (void)::clock_gettime(CLOCK_BOOTTIME, &now);
    const long milliseconds = now.tv_sec * 1000 + now.tv_nsec / 1'000'000;
    Note(std::to_string(g_steps) + " " + name + " " + std::to_string(milliseconds) + "\n");
    const char* const killAt = std::getenv("KILL_AT");
    if (killAt != nullptr && std::atoi(killAt) == g_steps) {
        ::raise(SIGKILL);
    }
    return ::dlsym(RTLD_NEXT, name);
}

// The arguments pass through untouched, however many there are: only registers are used, and the
// jump leaves the stack as the caller made it.
#define STEP(name)                                                                                 \
    asm(".pushsection .rodata\n"                                                                   \
        "0: .asciz \"" name "\"\n"                                                                 \
        ".popsection\n"                                                                            \
        ".globl " name "\n"                                                                        \
        ".type " name ", @function\n" name ":\n"                                                   \
        "endbr64\n"                                                                                \
        "push %rdi\n push %rsi\n push %rdx\n push %rcx\n push %r8\n push %r9\n push %rax\n"        \
        "lea 0b(%rip), %rdi\n"                                                                     \
        "call LabStep@PLT\n"                                                                       \
        "mov %rax, %r11\n"                                                                         \
        "pop %rax\n pop %r9\n pop %r8\n pop %rcx\n pop %rdx\n pop %rsi\n pop %rdi\n"               \
        "jmp *%r11\n")

STEP("VLIBCFileLockTimeByFile");
STEP("VLIBCFileUnlockByFile");
STEP("VLIBNetGetInterfaceInfo");
STEP("VLIBServiceStart");
STEP("VLIBCExec");
STEP("VLIBCExecl");
STEP("VLIBCExecv");
STEP("VLIBCPopen");
STEP("VLIBCFileSetKeys");
STEP("VLIBCFileSetKeyValue");
STEP("VORNNetGetEthInfo");
STEP("_ZN10vornnetsdk4hook8BaseHook8ExecHookE23_tag_sdk_plugin_action_");
STEP("rename");
STEP("unlink");
STEP("sleep");
