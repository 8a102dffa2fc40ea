#include "core/error.h"

#include <array>
#include <cstdio>

#include <vornplatform/core.h>

namespace {

struct LastError {
    int code = 0;
    int line = 0;
    std::array<char, 256> file{};
};

thread_local LastError t_lastError;

} // namespace

void VLIBCErrSetEx(int code, const char* file, int line)
{
    t_lastError.code = code;
    t_lastError.line = line;
    (void)std::snprintf(t_lastError.file.data(), t_lastError.file.size(), "%s",
                        file != nullptr ? file : "");
}

int VLIBCErrGetEx(const char** file, int* line)
{
    if (file != nullptr) {
        *file = t_lastError.file.data();
    }
    if (line != nullptr) {
        *line = t_lastError.line;
    }
    return t_lastError.code;
}
