#include "core/arguments.h"
#include "core/guard.h"
#include "core/heldlocks.h"
#include "core/program.h"
#include "core/refusal.h"

#include <cstdarg>
#include <map>
#include <mutex>
#include <string>
#include <string_view>
#include <vector>

#include <fcntl.h>
#include <sys/mman.h>
#include <vornplatform/core.h>

namespace {

using vornhost::Descriptor;
using vornhost::Guarded;
using vornhost::ProgramRequest;
using vornhost::RunnerReport;
using vornhost::RunningProgram;

/** Above the standard descriptors, which a client may have closed. */
constexpr int kFirstOwnDescriptor = 3;
/** Told to the client for a program that never ran, as shells do. */
constexpr int kNotRunStatus = 127 << 8;

/** What stands behind a stream: a program that runs, or the status of one that ran. */
struct Source {
    std::optional<RunningProgram> program;
    int status = 0;
};

/** The open streams of this process. */
class Streams {
public:
    static Streams& Instance()
    {
        // Never destroyed: a client's thread may still read while the process exits.
        static auto* const streams = new Streams;
        return *streams;
    }

    /** Makes a stream of the descriptor. @return null: failed. */
    FILE* Open(Descriptor descriptor, Source source)
    {
        const std::lock_guard<std::mutex> guard(m_mutex);
        FILE* const stream = ::fdopen(descriptor.Get(), "r");
        if (stream == nullptr) {
            return nullptr;
        }
        (void)descriptor.Release(); // the stream's from now on
        try {
            m_sources.emplace(stream, std::move(source));
        } catch (const std::exception&) {
            (void)std::fclose(stream);
            return nullptr;
        }
        return stream;
    }

    std::optional<Source> Take(FILE* stream)
    {
        const std::lock_guard<std::mutex> guard(m_mutex);
        const auto found = m_sources.find(stream);
        if (found == m_sources.end()) {
            return std::nullopt;
        }
        Source source = std::move(found->second);
        m_sources.erase(found);
        return source;
    }

private:
    std::mutex m_mutex;
    std::map<FILE*, Source> m_sources;
};

ProgramRequest Request(const std::vector<std::string>& argv, Descriptor output)
{
    ProgramRequest request;
    request.argv = argv;
    request.output = std::move(output);
    request.locks = vornhost::DuplicateHeldLocks();
    return request;
}

int StatusOf(const RunnerReport& report)
{
    return report.startError == 0 ? report.status : kNotRunStatus;
}

/** The program writes while the client reads. */
FILE* OpenDirect(const std::vector<std::string>& argv)
{
    int ends[2] = {-1, -1};
    if (::pipe2(ends, O_CLOEXEC) != 0) {
        return nullptr;
    }
    Descriptor stream = AboveStandard(Descriptor(ends[0]));
    Descriptor writeEnd(ends[1]);
    if (!stream) {
        return nullptr;
    }
    std::optional<RunningProgram> program =
        vornhost::StartProgram(Request(argv, std::move(writeEnd)));
    if (!program) {
        return nullptr;
    }
    return Streams::Instance().Open(std::move(stream), {std::move(program), 0});
}

/** The program's whole answer; its status in the report. */
Descriptor ReadAnswer(const std::vector<std::string>& argv, RunnerReport& report)
{
    Descriptor answer = AboveStandard(Descriptor(::memfd_create("answer", MFD_CLOEXEC)));
    report.startError = ENOMEM;
    if (answer) {
        Descriptor output(::fcntl(answer.Get(), F_DUPFD_CLOEXEC, kFirstOwnDescriptor));
        report = vornhost::RunProgram(Request(argv, std::move(output)));
        (void)::lseek(answer.Get(), 0, SEEK_SET);
    }
    return answer;
}

/**
 * The program has ended when the client begins to read. Clients take what they read for the whole
 * truth and do not look at the status, so a program that failed is given a second chance, and the
 * beginning of an answer is never shown for all of it.
 */
FILE* OpenCollected(const std::vector<std::string>& argv)
{
    RunnerReport report;
    Descriptor answer = ReadAnswer(argv, report);
    if (report.startError == 0 && report.status != 0 && report.timedOut == 0) {
        answer = ReadAnswer(argv, report);
    }
    if (report.startError != 0) {
        return nullptr;
    }
    return Streams::Instance().Open(std::move(answer), {std::nullopt, report.status});
}

} // namespace

FILE* VLIBCPopen(const char* path, const char* mode, ...)
{
    if (path == nullptr || mode == nullptr) {
        return nullptr;
    }
    va_list arguments;
    va_start(arguments, mode);
    FILE* const stream = Guarded<FILE*>(nullptr, [&]() -> FILE* {
        const auto argv = vornhost::CollectArguments(path, arguments);
        const std::string_view how = mode;
        if (vornhost::IsRefused(argv)) {
            return nullptr;
        }
        if (how == "rB" && ::faccessat(AT_FDCWD, path, X_OK, AT_EACCESS) == 0) {
            return OpenDirect(argv);
        }
        return how == "r" ? OpenCollected(argv) : nullptr;
    });
    va_end(arguments);
    return stream;
}

int VLIBCPclose(FILE* stream)
{
    return Guarded(-1, [&] {
        std::optional<Source> source = Streams::Instance().Take(stream);
        if (!source) {
            return -1;
        }
        (void)std::fclose(stream); // first, or a program that still writes would wait for us
        return source->program ? StatusOf(source->program->Wait()) : source->status;
    });
}
