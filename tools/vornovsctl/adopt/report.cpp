#include "adopt/report.h"

#include "adopt/writer.h"
#include "wording.h"

#include <algorithm>
#include <sstream>

namespace vornovsctl {

namespace {

std::string Indented(const std::string& text)
{
    std::istringstream stream(text);
    std::string result;
    for (std::string line; std::getline(stream, line);) {
        result += "    " + line + '\n';
    }
    return result;
}

std::string OriginText(const std::string& origin)
{
    return origin.empty() ? "" : ", " + origin;
}

std::string DaemonOf(Manager manager)
{
    return manager == Manager::kNobody ? "nobody manages it" : NameOf(manager);
}

std::string SilencerText(const SilencingFile& file)
{
    return file.kind == Silencer::kInterfaces ? file.path + " (their paragraphs are commented out)"
                                              : file.path;
}

Json UnitsOf(const AdoptionRecord& record, bool enable, bool released)
{
    Json units = Json::array();
    for (const ChangedUnit& unit : record.units) {
        if ((released ? unit.before : unit.enable) == enable) {
            units.push_back(unit.unit);
        }
    }
    return units;
}

Json PathsOf(const AdoptionRecord& record)
{
    Json paths = Json::array();
    for (const SilencingFile& file : record.silencers) {
        paths.push_back(file.path);
    }
    return paths;
}

} // namespace

std::string ObstaclesText(const Wishes& wishes)
{
    std::string text;
    for (const auto& [name, wish] : wishes) {
        for (const std::string& obstacle : wish.obstacles) {
            text.append(text.empty() ? "" : "\n").append(name).append(": ").append(obstacle);
        }
    }
    return text;
}

std::string AdoptionText(const Wishes& wishes, const AdoptionRecord& record)
{
    std::string text;
    for (const auto& [name, wish] : wishes) {
        text += name + " (" + DaemonOf(wish.manager) + OriginText(wish.origin) + ")\n";
        text += "  " + FilePathOf(name) + ":\n" + Indented(FileTextOf(wish));
        for (const std::string& remark : wish.remarks) {
            text += "  note: " + remark + '\n';
        }
    }
    std::string kept;
    for (const SilencingFile& file : record.silencers) {
        kept += "  " + SilencerText(file) + '\n';
    }
    text += kept.empty() ? "" : "Kept away from them by:\n" + kept;
    for (const ChangedUnit& unit : record.units) {
        text += (unit.enable ? "At boot from now on: " : "At boot no longer: ") + unit.unit + '\n';
    }
    return text;
}

Json AdoptionFields(const Wishes& wishes, const AdoptionRecord& record, bool done)
{
    Json fields;
    fields["interfaces"] = Json::array();
    for (const auto& [name, wish] : wishes) {
        fields["interfaces"].push_back({{"name", name},
                                        {"manager", NameOf(wish.manager)},
                                        {"origin", wish.origin},
                                        {"file", FilePathOf(name)},
                                        {"text", FileTextOf(wish)},
                                        {"obstacles", wish.obstacles},
                                        {"remarks", wish.remarks}});
    }
    fields["silencedBy"] = PathsOf(record);
    fields["enabled"] = UnitsOf(record, true, false);
    fields["disabled"] = UnitsOf(record, false, false);
    fields["done"] = done;
    return fields;
}

std::string ReleaseText(const AdoptionRecord& record, const std::set<std::string>& names)
{
    std::string text;
    for (const AdoptedInterface& interface : record.interfaces) {
        if (names.contains(interface.name)) {
            text += interface.name + " back to " +
                    (interface.manager == Manager::kNobody ? "nobody" : NameOf(interface.manager)) +
                    OriginText(interface.origin) + '\n';
        }
    }
    const bool all = std::all_of(
        record.interfaces.begin(), record.interfaces.end(),
        [&](const AdoptedInterface& interface) { return names.contains(interface.name); });
    for (const SilencingFile& file : record.silencers) {
        text +=
            (all ? (file.before ? "As it was: " : "Removed: ") : "Changed: ") + file.path + '\n';
    }
    for (const ChangedUnit& unit : record.units) {
        if (all) {
            text += (unit.before ? "At boot again: " : "At boot no longer: ") + unit.unit + '\n';
        }
    }
    return text;
}

Json ReleaseFields(const AdoptionRecord& record, const std::set<std::string>& names, bool done)
{
    Json fields;
    fields["interfaces"] = Json::array();
    for (const AdoptedInterface& interface : record.interfaces) {
        if (names.contains(interface.name)) {
            fields["interfaces"].push_back({{"name", interface.name},
                                            {"manager", NameOf(interface.manager)},
                                            {"origin", interface.origin}});
        }
    }
    fields["files"] = PathsOf(record);
    fields["enabled"] = UnitsOf(record, true, true);
    fields["disabled"] = UnitsOf(record, false, true);
    fields["done"] = done;
    return fields;
}

} // namespace vornovsctl
