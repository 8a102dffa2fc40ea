#include "support/figures.h"

#include <gtest/gtest.h>

#include <cstdio>
#include <cstdlib>

#include <fcntl.h>
#include <unistd.h>

namespace reliability {

void Figure(const std::string& line)
{
    (void)std::printf("%s\n", line.c_str());
    (void)std::fflush(stdout);
    const char* const path = std::getenv("VORNOVS_FIGURES");
    if (path == nullptr) {
        return;
    }
    const std::string text = line + "\n";
    const int file = ::open(path, O_WRONLY | O_CREAT | O_APPEND | O_CLOEXEC, 0644);
    EXPECT_EQ(::write(file, text.data(), text.size()), static_cast<ssize_t>(text.size())) << path;
    (void)::close(file);
}

} // namespace reliability
