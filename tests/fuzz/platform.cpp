#include "platform.h"

#include "text.h"

#include <vornplatform/core.h>
#include <vornplatform/netsdk.h>
#include <vornplatform/sdk.h>

#include <array>
#include <cstdarg>
#include <cstdio>
#include <cstring>
#include <utility>

#include <syslog.h>

namespace fuzz {

SwitchAnswers& Answers()
{
    static SwitchAnswers answers;
    return answers;
}

} // namespace fuzz

namespace {

/** The wait status of the program whose output is read; one at a time is open. */
std::pair<FILE*, int> openTag;

FILE* StreamOf(std::string& text)
{
    return text.empty() ? std::fopen("/dev/null", "re") : ::fmemopen(text.data(), text.size(), "r");
}

} // namespace

/** Lines are put together and dropped: what is logged is not what is looked at. */
void syslog(int /*priority*/, const char* format, ...)
{
    std::array<char, 512> line{};
    va_list arguments;
    va_start(arguments, format);
    (void)std::vsnprintf(line.data(), line.size(), format, arguments);
    va_end(arguments);
}

/** Copies; nothing else that is run changes a file. */
int VLIBCExec(const char* path, ...)
{
    if (std::strcmp(path, "/bin/cp") != 0) {
        return 0;
    }
    va_list arguments;
    va_start(arguments, path);
    (void)va_arg(arguments, const char*); // the option
    const std::string source = va_arg(arguments, const char*);
    const std::string target = va_arg(arguments, const char*);
    va_end(arguments);
    if (!fuzz::Exists(source)) {
        return -1;
    }
    fuzz::WriteFile(target, fuzz::ReadFile(source));
    return fuzz::Exists(target) ? 0 : -1;
}

int VLIBCExecl(const char* /*path*/, int /*options*/, ...)
{
    return 0;
}

int VLIBCExecv(const char* /*path*/, const char* const* /*argv*/, int /*wait*/)
{
    return 0;
}

FILE* VLIBCPopen(const char* /*path*/, const char* mode, ...)
{
    va_list arguments;
    va_start(arguments, mode);
    const std::string verb = va_arg(arguments, const char*);
    va_end(arguments);
    if (verb == "list-br") {
        return StreamOf(fuzz::Answers().bridges);
    }
    openTag = {StreamOf(fuzz::Answers().tag), fuzz::Answers().status};
    return openTag.first;
}

int VLIBCPclose(FILE* stream)
{
    const bool isTag = stream == openTag.first;
    (void)std::fclose(stream);
    return isTag ? std::exchange(openTag, {}).second : 0;
}

int VLIBCFileLock(int /*lockWord*/, int /*seconds*/)
{
    return 0;
}

int VLIBCFileUnlock(int /*lockWord*/)
{
    return 0;
}

void VLIBCErrSetEx(int /*code*/, const char* /*file*/, int /*line*/) {}

int VLIBServiceIsRunning(const char* /*name*/)
{
    return 1;
}

int VLIBServiceStart(const char* /*name*/, int /*flags*/)
{
    return 0;
}

int VLIBServiceStop(const char* /*name*/, int /*flags*/)
{
    return 0;
}

int VLIBNetGetInterfaceInfo(VLIBNETIFINFO* /*entries*/, int /*capacity*/, int /*selector*/)
{
    return 0;
}

int VLIBNetBridgeIfIsMaster(const char* /*name*/)
{
    return 0;
}

int VLIBNetVlanGet(const char* /*name*/, _tag_VLIB_VLAN* /*vlan*/)
{
    return 0;
}

int VLIBNetOVSIfIsMaster(const char* /*name*/)
{
    return 1;
}

int VORNNetBondIPConflict(const char* /*bond*/, char* /*conflict*/, int /*size*/,
                          unsigned int* /*out*/)
{
    return 0;
}
