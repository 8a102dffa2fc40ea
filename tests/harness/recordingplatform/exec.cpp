// Programs and services.
#include "recordingplatform/keyvaluemodel.h"
#include "recordingplatform/recorder.h"

#include <vornplatform/core.h>

#include <gtest/gtest.h>

#include <cstdarg>
#include <utility>

using harness::CallText;
using harness::Expect;
using harness::PlatformCall;
using harness::Recorder;

namespace {

/** Option word of the platform's standard way of running a system script. */
constexpr int kExecOptions = 0xBB;

const Recorder::ProgramOutput* FindOutput(const Recorder& recorder, const std::string& call)
{
    const Recorder::ProgramOutput* found = nullptr;
    for (const auto& [words, output] : recorder.m_outputs) {
        if (harness::Matches(call, words)) {
            found = &output;
        }
    }
    return found;
}

FILE* OpenPipe(Recorder& recorder, const std::string& call, const std::string& command)
{
    const Recorder::ProgramOutput* const output = FindOutput(recorder, call);
    const bool asksForTag = call.find(" get port ") != std::string::npos;
    Recorder::OpenPipe pipe{command, asksForTag ? "[]\n" : "", 0};
    if (output != nullptr) {
        pipe.text = output->text;
        pipe.status = output->status;
    }
    if (const auto once = std::exchange(recorder.m_nextOutput, std::nullopt)) {
        pipe.text = once->text;
        pipe.status = once->status;
    }
    FILE* const stream = std::tmpfile();
    if (stream == nullptr) {
        harness::Abort("no temporary file for a program's output");
    }
    (void)std::fwrite(pipe.text.data(), 1, pipe.text.size(), stream);
    std::rewind(stream);
    recorder.Open(stream, "pipe of " + command, [stream] { (void)std::fclose(stream); });
    recorder.m_pipes[stream] = pipe;
    return stream;
}

} // namespace

int VLIBCExec(const char* path, ...)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("VLIBCExec");
    va_list list;
    va_start(list, path);
    const std::vector<std::string> arguments = harness::Arguments("VLIBCExec", path, list);
    va_end(list);

    const std::optional<int> answer = recorder.Call(CallText("VLIBCExec", arguments));
    if (answer) {
        return *answer;
    }
    if (recorder.m_carryOutEdits && arguments.size() == 4 && arguments[0] == "/bin/cp" &&
        arguments[1] == "-f") {
        return harness::CopyFile(arguments[2], arguments[3]) ? 0 : -1;
    }
    return 0;
}

int VLIBCExecl(const char* path, int options, ...)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("VLIBCExecl");
    va_list list;
    va_start(list, options);
    const std::vector<std::string> arguments = harness::Arguments("VLIBCExecl", path, list);
    va_end(list);

    Expect("VLIBCExecl", "option word", options, kExecOptions);
    return recorder.Call(CallText("VLIBCExecl", arguments)).value_or(0);
}

int VLIBCExecv(const char* path, const char* const argv[], int wait)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("VLIBCExecv");
    if (path == nullptr || argv == nullptr) {
        return recorder.Call("VLIBCExecv").value_or(-1);
    }

    const std::vector<std::string> arguments = harness::Elements("VLIBCExecv", argv);
    Expect("VLIBCExecv", "wait", wait, 1);
    if (arguments.empty() || arguments[0] != path) {
        ADD_FAILURE() << "VLIBCExecv: the vector's first element is not the program " << path;
    }
    return recorder.Call(CallText("VLIBCExecv", arguments)).value_or(0);
}

FILE* VLIBCPopen(const char* path, const char* mode, ...)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("VLIBCPopen");
    va_list list;
    va_start(list, mode);
    std::vector<std::string> arguments = harness::Arguments("VLIBCPopen", path, list);
    va_end(list);

    const std::string command = CallText(arguments[0], {arguments.begin() + 1, arguments.end()});
    arguments.insert(arguments.begin() + 1, harness::Text("VLIBCPopen", mode));
    const std::string call = CallText("VLIBCPopen", arguments);
    if (recorder.Call(call).value_or(1) == 0) {
        return nullptr;
    }
    return OpenPipe(recorder, call, command);
}

int VLIBCPclose(FILE* stream)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("VLIBCPclose");
    if (!recorder.Close(stream, "VLIBCPclose")) {
        return -1;
    }

    const Recorder::OpenPipe pipe = recorder.m_pipes[stream];
    recorder.m_pipes.erase(stream);
    (void)std::fclose(stream);
    return recorder.Call("VLIBCPclose " + pipe.command).value_or(pipe.status);
}

int VLIBServiceIsRunning(const char* name)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("VLIBServiceIsRunning");
    return recorder
        .Call(CallText("VLIBServiceIsRunning", {harness::Text("VLIBServiceIsRunning", name)}))
        .value_or(1);
}

int VLIBServiceStart(const char* name, int flags)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("VLIBServiceStart");
    Expect("VLIBServiceStart", "flags", flags, 0);
    return recorder.Call(CallText("VLIBServiceStart", {harness::Text("VLIBServiceStart", name)}))
        .value_or(0);
}

int VLIBServiceStop(const char* name, int flags)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("VLIBServiceStop");
    Expect("VLIBServiceStop", "flags", flags, 0);
    return recorder.Call(CallText("VLIBServiceStop", {harness::Text("VLIBServiceStop", name)}))
        .value_or(0);
}

int VLIBServiceRestart(const char* name)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("VLIBServiceRestart");
    return recorder
        .Call(CallText("VLIBServiceRestart", {harness::Text("VLIBServiceRestart", name)}))
        .value_or(0);
}
