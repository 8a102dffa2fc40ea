#include "terminal.h"

#include <clocale>
#include <cstdlib>
#include <langinfo.h>
#include <string_view>
#include <sys/ioctl.h>
#include <unistd.h>

namespace vornovsctl {

namespace {

// Narrower than that, a tree is no tree any more.
constexpr std::size_t kNarrowest = 40;

bool LocaleHasUnicode()
{
    (void)setlocale(LC_CTYPE, "");
    return std::string_view(nl_langinfo(CODESET)) == "UTF-8";
}

bool WantsColour()
{
    const char* const refusal = std::getenv("NO_COLOR");
    const char* const kind = std::getenv("TERM");
    return (refusal == nullptr || *refusal == '\0') && kind != nullptr &&
           std::string_view(kind) != "dumb";
}

} // namespace

Terminal StandardOutput()
{
    Terminal terminal;
    terminal.unicode = LocaleHasUnicode();
    if (isatty(STDOUT_FILENO) == 0) {
        return terminal;
    }
    terminal.colour = WantsColour();
    winsize size{};
    if (ioctl(STDOUT_FILENO, TIOCGWINSZ, &size) == 0 && size.ws_col >= kNarrowest) {
        terminal.width = size.ws_col;
    }
    return terminal;
}

} // namespace vornovsctl
