#include "commandline.h"

#include "checks.h"
#include "help.h"
#include "wording.h"

#include <CLI/CLI.hpp>
#include <vornovs/vornovs.h>

#include <deque>
#include <map>
#include <memory>
#include <string_view>

namespace vornovsctl {

namespace {

void Refuse(const std::string& subject, const std::string& fault)
{
    if (!fault.empty()) {
        throw CLI::ValidationError(subject + ' ' + fault);
    }
}

bool IsModeFor(bool ofTheSwitch, VORN_LINK_AGGR_MODE mode)
{
    return mode > VORN_LINK_AGGR_NONE && VORN::OVS::CheckModeSupport(mode) == ofTheSwitch;
}

void AddBondMode(const std::string& text, bool ofTheSwitch, Arguments& arguments)
{
    const std::size_t sign = text.find('=');
    if (sign == std::string::npos) {
        throw CLI::ValidationError("--bond-mode wants BOND=MODE");
    }

    const std::string bond = text.substr(0, sign);
    const std::string mode = text.substr(sign + 1);
    Refuse("the bond's name", InterfaceFault(bond));
    if (!IsModeFor(ofTheSwitch, ModeOf(mode))) {
        throw CLI::ValidationError(Quoted(mode) + " is no bond mode of " +
                                   (ofTheSwitch ? "the switch" : "Linux"));
    }
    if (!arguments.bondModes.emplace(bond, mode).second) {
        throw CLI::ValidationError("bond " + Quoted(bond) + " has two modes");
    }
}

// Asked before anything else is known of the command line, since the answer to a wrong one is JSON
// as well.
bool AsksForJson(int argc, const char* const argv[])
{
    for (int index = 1; index < argc && std::string_view(argv[index]) != "--"; ++index) {
        if (std::string_view(argv[index]) == "--json") {
            return true;
        }
    }
    return false;
}

// Says "SLAVE..." for an operand of which there can be several.
class HelpFormatter : public CLI::Formatter {
public:
    std::string make_option_usage(const CLI::Option* option) const override
    {
        const std::string name =
            option->get_name(true) + (option->get_expected_max() > 1 ? "..." : "");
        return option->get_required() ? name : '[' + name + ']';
    }
};

class CommandLine {
public:
    CommandLine()
    {
        m_app.formatter(std::make_shared<HelpFormatter>());
        m_app.name("vornovsctl");
        m_app.footer(kExitStatus);
        m_app.set_version_flag("--version", "vornovsctl " VORNOVS_VERSION);
        m_app.require_subcommand(1);
        for (const CommandRow& row : Commands()) {
            AddCommand(row);
        }
    }

    ParsedCommand Parse(int argc, const char* const argv[])
    {
        ParsedCommand parsed;
        parsed.json = AsksForJson(argc, argv);
        try {
            m_app.parse(argc, argv);
            Check();
            parsed.command = m_command;
            parsed.arguments = m_arguments;
            parsed.json = m_arguments.IsJson();
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
    CLI::App* GroupOf(const CommandRow& row)
    {
        if (*row.group == '\0') {
            return &m_app;
        }
        CLI::App*& group = m_groups[row.group];
        if (group == nullptr) {
            for (const GroupRow& each : Groups()) {
                if (std::string_view(each.name) == row.group) {
                    group = m_app.add_subcommand(each.name, each.about)->require_subcommand(1);
                    group->footer(std::string("'vornovsctl ") + each.name +
                                  " COMMAND --help' tells more of a command.");
                }
            }
        }
        return group;
    }

    void AddCommand(const CommandRow& row)
    {
        CLI::App* const sub = GroupOf(row)->add_subcommand(row.name, row.about);
        sub->footer(row.more);
        sub->callback([this, &row] { m_command = &row; });
        for (const Operand& operand : row.operands) {
            // Each command has places of its own for the values, which stay where they are.
            m_values.push_back({&row, &operand, {}});
            sub->add_option(operand.name, m_values.back().values, operand.about)
                ->required(operand.least > 0)
                ->expected(static_cast<int>(operand.least), static_cast<int>(operand.most))
                ->allow_extra_args(operand.most > 1)
                ->type_name("");
        }
        sub->add_flag("--json", m_json, "Print one JSON object");
        AddOption(row, *sub);
    }

    void AddOption(const CommandRow& row, CLI::App& sub)
    {
        switch (row.option) {
        case Option::kSwitchModes:
        case Option::kLinuxModes:
            sub.add_option("--bond-mode", m_bondModes, "The mode that a bond is to have")
                ->type_name("BOND=MODE")
                ->allow_extra_args(false);
            break;
        case Option::kYes:
        case Option::kConfirm:
            sub.add_flag("--yes", m_arguments.yes, "Say that this is really meant");
            break;
        case Option::kFormat:
            sub.add_option("--format", m_arguments.format, "text, dot or json")
                ->check(CLI::IsMember({"text", "dot", "json"}));
            break;
        case Option::kDryRun:
            sub.add_flag("--dry-run", m_arguments.dryRun, "Only say what would be done");
            break;
        case Option::kNone:
            break;
        }
    }

    void Check()
    {
        for (const Values& each : m_values) {
            if (each.row == m_command) {
                for (const std::string& value : each.values) {
                    Refuse(each.operand->subject, each.operand->fault(value));
                }
                m_arguments.operands[each.operand->name] = each.values;
            }
        }
        if (m_arguments.operands.contains("SLAVE")) {
            Refuse("the interfaces", SlavesFault(m_arguments.All("SLAVE")));
        }
        for (const std::string& text : m_bondModes) {
            AddBondMode(text, m_command->option == Option::kSwitchModes, m_arguments);
        }
        if (m_command->option == Option::kYes && !m_arguments.yes) {
            throw CLI::ValidationError("reset forgets every client: say --yes if that is meant");
        }
        if (m_json) {
            if (m_arguments.format == "dot") {
                throw CLI::ValidationError("--json and --format dot are two things");
            }
            m_arguments.format = "json";
        }
    }

    struct Values {
        const CommandRow* row;
        const Operand* operand;
        std::vector<std::string> values;
    };

    CLI::App m_app{kAbout};
    std::map<std::string_view, CLI::App*> m_groups;
    std::deque<Values> m_values;
    const CommandRow* m_command = nullptr;
    Arguments m_arguments;
    std::vector<std::string> m_bondModes;
    bool m_json = false;
};

} // namespace

ParsedCommand ParseCommand(int argc, const char* const argv[])
{
    return CommandLine().Parse(argc, argv);
}

} // namespace vornovsctl
