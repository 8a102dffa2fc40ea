#include "commandline.h"

#include "help.h"

#include <CLI/CLI.hpp>
#include <vornovs/vornovs.h>

#include <algorithm>
#include <vector>

namespace vornovsctl {

namespace {

using VORN::OVS::BondManager;

constexpr std::size_t kLongestInterfaceName = 15;
constexpr std::size_t kLongestClientName = 255;

// What stands in a file of lines, in paths and among options has to stay what it is.
std::string WhatIsWrongWith(const std::string& name, std::size_t longest)
{
    if (name.empty()) {
        return "is empty";
    }
    if (name.size() > longest) {
        return "is longer than " + std::to_string(longest) + " characters";
    }
    if (name.front() == '-') {
        return "begins with '-'";
    }
    if (std::any_of(name.begin(), name.end(), [](char each) {
            const auto byte = static_cast<unsigned char>(each);
            return byte < 0x20 || byte == 0x7f;
        })) {
        return "holds a line break or another control character";
    }
    return name.find('/') == std::string::npos ? "" : "holds a slash";
}

void CheckClient(const std::string& name)
{
    const std::string fault = WhatIsWrongWith(name, kLongestClientName);
    if (!fault.empty()) {
        throw CLI::ValidationError("the client's name " + fault);
    }
}

bool IsModeFor(Verb verb, VORN_LINK_AGGR_MODE mode)
{
    return mode > VORN_LINK_AGGR_NONE &&
           BondManager::CheckModeSupport(mode) == (verb == Verb::kRegister);
}

void AddBondMode(const std::string& text, Command& command)
{
    const std::size_t sign = text.find('=');
    if (sign == std::string::npos) {
        throw CLI::ValidationError("--bond-mode wants BOND=MODE");
    }

    const std::string bond = text.substr(0, sign);
    const std::string mode = text.substr(sign + 1);
    std::string fault = WhatIsWrongWith(bond, kLongestInterfaceName);
    if (fault.empty() && bond.find_first_of(" :") != std::string::npos) {
        fault = "holds a blank or a colon";
    }
    if (!fault.empty()) {
        throw CLI::ValidationError("the bond's name " + fault);
    }
    if (!IsModeFor(command.verb, BondManager::StrToMode(mode))) {
        throw CLI::ValidationError("'" + mode + "' is no bond mode of " +
                                   (command.verb == Verb::kRegister ? "the switch" : "Linux"));
    }
    if (!command.bondModes.emplace(bond, mode).second) {
        throw CLI::ValidationError("bond '" + bond + "' has two modes");
    }
}

class CommandLine {
public:
    CommandLine()
    {
        m_app.name("vornovsctl");
        m_app.footer(kExitStatus);
        m_app.set_version_flag("--version", "vornovsctl " VORNOVS_VERSION);
        m_app.require_subcommand(1);
        AddClientVerb("register", kAboutRegister, kRegisterMore, Verb::kRegister);
        AddClientVerb("unregister", kAboutUnregister, kUnregisterMore, Verb::kUnregister);
        AddVerb("status", kAboutStatus, kStatusMore, Verb::kStatus)
            ->add_flag("--json", m_command.json, "Print one JSON object");
        AddVerb("reset", kAboutReset, kResetMore, Verb::kReset)
            ->add_flag("--yes", m_command.yes, "Say that this is really meant");
    }

    ParsedCommand Parse(int argc, const char* const argv[])
    {
        ParsedCommand parsed;
        try {
            m_app.parse(argc, argv);
            Check();
            parsed.command = m_command;
        } catch (const CLI::CallForHelp&) {
            parsed.output = m_app.help();
        } catch (const CLI::CallForVersion& version) {
            parsed.output = std::string(version.what()) + '\n';
        } catch (const CLI::ParseError& error) {
            parsed.error = error.what();
        }
        return parsed;
    }

private:
    CLI::App* AddVerb(const char* name, const char* about, const char* more, Verb verb)
    {
        CLI::App* const sub = m_app.add_subcommand(name, about);
        sub->footer(more);
        sub->callback([this, verb] { m_command.verb = verb; });
        return sub;
    }

    void AddClientVerb(const char* name, const char* about, const char* more, Verb verb)
    {
        CLI::App* const sub = AddVerb(name, about, more, verb);
        sub->add_option("NAME", m_command.client, "The client's name")->required();
        sub->add_option("--bond-mode", m_bondModes, "The mode that a bond is to have")
            ->type_name("BOND=MODE")
            ->allow_extra_args(false);
    }

    void Check()
    {
        if (m_command.verb == Verb::kRegister || m_command.verb == Verb::kUnregister) {
            CheckClient(m_command.client);
        }
        for (const std::string& text : m_bondModes) {
            AddBondMode(text, m_command);
        }
        if (m_command.verb == Verb::kReset && !m_command.yes) {
            throw CLI::ValidationError("reset forgets every client: say --yes if that is meant");
        }
    }

    CLI::App m_app{kAbout};
    Command m_command;
    std::vector<std::string> m_bondModes;
};

} // namespace

ParsedCommand ParseCommand(int argc, const char* const argv[])
{
    return CommandLine().Parse(argc, argv);
}

} // namespace vornovsctl
