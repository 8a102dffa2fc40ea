/**
 * The lists of clients and interfaces. The text is a name and then the list's file.
 */
#include "subject.h"
#include "text.h"

#include "state/namefile.h"
#include "state/statefiles.h"

#include <vornovs/vornovs.h>

namespace {

using fuzz::Expect;
using Names = std::set<std::string>;

Names NamesIn(std::string_view text)
{
    Names names;
    for (const std::string& line : fuzz::LinesOf(text)) {
        names.insert(line.ends_with('\n') ? line.substr(0, line.size() - 1) : line);
    }
    return names;
}

/** What a file of these names holds. */
std::string TextOf(const Names& names)
{
    std::string text;
    for (const std::string& name : names) {
        text += name + "\n";
    }
    return text;
}

void ExpectFile(const std::string& path, const Names& names)
{
    Expect(fuzz::Exists(path) != names.empty(), "a list is there without names, or the other way");
    Expect(fuzz::ReadFile(path) == TextOf(names), "the file holds other names");
    Expect(fuzz::EntriesOf(VORN::OVS::kStateFolder).size() == (names.empty() ? 0U : 1U),
           "something stands beside the list");
}

Names With(Names names, const std::string& name)
{
    names.insert(name);
    return names;
}

void CheckClients(std::string_view text, const std::string& name)
{
    const Names before = NamesIn(text);
    fuzz::MakeEmptyFolder(VORN::OVS::kStateFolder);
    fuzz::WriteFile(VORN::OVS::kRegistrationPath, text);
    VORN::OVS::OVSRegConf clients;
    Names read;
    Expect(clients.LoadFromConfig() == 0, "the list of clients cannot be read");
    Expect(clients.GetRegNames(read) == static_cast<int>(before.size()) && read == before,
           "other clients are read than are listed");
    Expect(clients.IsRegister(name) == (before.contains(name) ? 1 : -1), "IsRegister is wrong");

    const bool isNew = !before.contains(name);
    Expect(clients.Register(name) == (isNew ? 0 : 1), "Register answers the wrong thing");
    if (isNew) {
        ExpectFile(VORN::OVS::kRegistrationPath, With(before, name));
        Expect(clients.UnRegister(name) == 0, "UnRegister answers the wrong thing");
        ExpectFile(VORN::OVS::kRegistrationPath, before);
    }
    Expect(clients.UnRegister(name) == (isNew ? 2 : 0), "UnRegister answers the wrong thing");
}

void CheckInterfaces(std::string_view text, const std::string& name)
{
    const Names before = NamesIn(text);
    fuzz::MakeEmptyFolder(VORN::OVS::kStateFolder);
    fuzz::WriteFile(VORN::OVS::kInterfaceListPath, text);
    VORN::OVS::OVSIfsConf interfaces(VORN::OVS::kInterfaceListPath);
    const bool isNew = !before.contains(name);
    Expect(interfaces.Write(name) == (isNew ? 0 : -1), "Write answers the wrong thing");
    Expect(isNew || fuzz::ReadFile(VORN::OVS::kInterfaceListPath) == text,
           "a name that is listed already changed the list");
    Names after = With(before, name);
    after.erase(name);
    Expect(interfaces.Remove(name) == 0, "Remove answers the wrong thing");
    ExpectFile(VORN::OVS::kInterfaceListPath, after);
    Expect(interfaces.Remove(name) == -1, "Remove answers the wrong thing");
}

void Run(std::string_view text)
{
    // What the file cannot hold: nothing checks it, and a name with a line break is two.
    const std::string name = fuzz::TakeUpTo("\n", text);
    CheckClients(text, name);
    CheckInterfaces(text, name);
}

const fuzz::Subject kSubject("name_lists", Run);

} // namespace
