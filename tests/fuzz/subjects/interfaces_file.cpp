/**
 * The file /etc/network/interfaces. The text is the names of interfaces, the file, and after a line
 * of its own with "%" another one, which either may include.
 */
#include "subject.h"
#include "text.h"

#include <adopt/interfacesfile.h>

#include <algorithm>

namespace {

using fuzz::Expect;
using vornovsctl::WithInterfacesAgain;
using vornovsctl::WithoutInterfaces;

constexpr char kMain[] = "/etc/network/interfaces";
constexpr char kOther[] = "/etc/network/interfaces.d/more";

/** Whether lines of it look as if they had been commented out by us before. */
bool HasMarks(const std::string& text)
{
    return text.find("#adopted# ") != std::string::npos ||
           text.find("#replaced# ") != std::string::npos;
}

void CheckTakingOut(const std::string& text, const std::set<std::string>& names)
{
    if (HasMarks(text)) {
        return;
    }
    const std::string without = WithoutInterfaces(text, names);
    Expect(WithInterfacesAgain(text) == text, "a file without marks was changed");
    Expect(WithInterfacesAgain(without) == text, "what was commented out came back as another");
    const auto nothing = [](const std::string&) { return std::vector<std::string>(); };
    const auto config = vornovsctl::ReadInterfacesConfig(
        kMain, [&](const std::string&) { return without; }, nothing);
    for (const std::string& name : names) {
        Expect(!config.Has(name), "an interface that was taken out is still configured");
        Expect(!config.IsBroughtUp(name), "an interface that was taken out is still brought up");
    }
}

void Run(std::string_view text)
{
    const std::vector<std::string> words = fuzz::WordsOf(fuzz::TakeUpTo("\n", text));
    const std::string main = fuzz::TakeUpTo("\n%\n", text);
    const std::string other(text);
    const auto read = [&](const std::string& path) { return path == kMain ? main : other; };
    const auto find = [](const std::string& pattern) {
        return std::vector<std::string>{pattern.find('d') == std::string::npos ? kMain : kOther};
    };
    const auto config = vornovsctl::ReadInterfacesConfig(kMain, read, find);
    Expect(config.paths.front() == kMain, "another file is read first");
    for (const auto& stanza : config.stanzas) {
        Expect(std::find(config.paths.begin(), config.paths.end(), stanza.path) !=
                   config.paths.end(),
               "a paragraph stands in no file");
    }
    CheckTakingOut(main, {words.begin(), words.end()});
}

const fuzz::Subject kSubject("interfaces_file", Run);

} // namespace
