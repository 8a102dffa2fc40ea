#include "adopt/adoptionrecord.h"

#include "answer.h"
#include "hands.h"

#include <algorithm>
#include <array>
#include <stdexcept>

namespace vornovsctl {

namespace {

constexpr char kRecordPath[] = "/usr/vorn/etc/vornnetd/adopted/record.json";
constexpr int kVersion = 1;

constexpr std::array kPhases{"adopting", "adopted", "releasing"};
constexpr std::array kSilencers{"interfaces", "network", "netdev", "keyfile", "cloud"};
constexpr std::array kManagers{Manager::kNobody, Manager::kIfupdown, Manager::kNetworkd,
                               Manager::kNetworkManager};

template <typename Value, std::size_t Size>
Value ValueOf(const std::array<const char*, Size>& names, const std::string& name)
{
    for (std::size_t index = 0; index < Size; ++index) {
        if (names[index] == name) {
            return static_cast<Value>(index);
        }
    }
    throw std::runtime_error("unknown word '" + name + "'");
}

template <typename Value, std::size_t Size>
const char* NameIn(const std::array<const char*, Size>& names, Value value)
{
    return names.at(static_cast<std::size_t>(value));
}

Manager ManagerOf(const std::string& name)
{
    const auto* const found =
        std::find_if(kManagers.begin(), kManagers.end(),
                     [&](Manager manager) { return NameOf(manager) == name; });
    if (found == kManagers.end()) {
        throw std::runtime_error("unknown manager '" + name + "'");
    }
    return *found;
}

/** JSON holds text in UTF-8 only, and files hold any bytes: two digits each, then. */
std::string ToDigits(const std::string& bytes)
{
    constexpr char kDigits[] = "0123456789abcdef";
    std::string text;
    for (const char byte : bytes) {
        const auto value = static_cast<unsigned char>(byte);
        text += kDigits[value >> 4U];
        text += kDigits[value & 0xfU];
    }
    return text;
}

std::string FromDigits(const std::string& digits)
{
    std::string bytes;
    for (std::size_t index = 0; index + 1 < digits.size(); index += 2) {
        bytes += static_cast<char>(std::stoi(digits.substr(index, 2), nullptr, 16));
    }
    return bytes;
}

bool IsPlainText(const std::string& text)
{
    return std::all_of(text.begin(), text.end(), [](char letter) {
        const auto byte = static_cast<unsigned char>(letter);
        return (byte >= ' ' && byte < 0x7f) || letter == '\n' || letter == '\t' || letter == '\r';
    });
}

Json BytesToJson(const std::string& bytes)
{
    return IsPlainText(bytes) ? Json(bytes) : Json{{"bytes", ToDigits(bytes)}};
}

std::string BytesFrom(const Json& json)
{
    return json.is_string() ? json.get<std::string>()
                            : FromDigits(json.at("bytes").get<std::string>());
}

Json ToJson(const std::optional<SavedFile>& file)
{
    if (!file) {
        return nullptr;
    }
    return {{"text", BytesToJson(file->text)},
            {"mode", file->mode},
            {"user", file->user},
            {"group", file->group}};
}

std::optional<SavedFile> SavedFrom(const Json& json)
{
    if (json.is_null()) {
        return std::nullopt;
    }
    return SavedFile{BytesFrom(json.at("text")), json.at("mode").get<unsigned>(),
                     json.at("user").get<unsigned>(), json.at("group").get<unsigned>()};
}

Json ToJson(const AdoptedInterface& interface)
{
    Json files = Json::array();
    for (const ChangedFile& file : interface.files) {
        files.push_back({{"path", file.path},
                         {"text", BytesToJson(file.text)},
                         {"mode", file.mode},
                         {"before", ToJson(file.before)}});
    }
    Json clients = Json::array();
    for (const EndedClient& client : interface.clients) {
        clients.push_back({{"pidFile", client.pidFile}, {"words", client.words}});
    }
    return {{"name", interface.name},
            {"manager", NameOf(interface.manager)},
            {"origin", interface.origin},
            {"profile", interface.profile},
            {"phase", NameIn(kPhases, interface.phase)},
            {"files", files},
            {"clients", clients},
            {"stateLine", interface.stateLine},
            {"settings", interface.settings}};
}

AdoptedInterface InterfaceFrom(const Json& json)
{
    AdoptedInterface interface;
    interface.name = json.at("name").get<std::string>();
    interface.manager = ManagerOf(json.at("manager").get<std::string>());
    interface.origin = json.at("origin").get<std::string>();
    interface.profile = json.at("profile").get<std::string>();
    interface.phase = ValueOf<Phase>(kPhases, json.at("phase").get<std::string>());
    for (const Json& file : json.at("files")) {
        interface.files.push_back({file.at("path").get<std::string>(), BytesFrom(file.at("text")),
                                   file.at("mode").get<unsigned>(), SavedFrom(file.at("before"))});
    }
    for (const Json& client : json.at("clients")) {
        interface.clients.push_back({client.at("pidFile").get<std::string>(),
                                     client.at("words").get<std::vector<std::string>>()});
    }
    interface.stateLine = json.at("stateLine").get<std::string>();
    interface.settings = json.at("settings").get<std::map<std::string, std::string>>();
    return interface;
}

AdoptionRecord RecordFrom(const Json& json)
{
    if (json.at("version").get<int>() != kVersion) {
        throw std::runtime_error("it is of another version");
    }
    AdoptionRecord record;
    for (const Json& interface : json.at("interfaces")) {
        record.interfaces.push_back(InterfaceFrom(interface));
    }
    for (const Json& file : json.at("silencers")) {
        record.silencers.push_back(
            {ValueOf<Silencer>(kSilencers, file.at("kind").get<std::string>()),
             file.at("path").get<std::string>(), file.at("device").get<std::string>(),
             SavedFrom(file.at("before"))});
    }
    for (const Json& unit : json.at("units")) {
        record.units.push_back({unit.at("unit").get<std::string>(), unit.at("enable").get<bool>(),
                                unit.at("before").get<bool>()});
    }
    return record;
}

} // namespace

std::optional<AdoptionRecord> AdoptionRecord::Load(const Hands& hands)
{
    const auto file = hands.Read(kRecordPath);
    if (!file) {
        return std::nullopt;
    }
    try {
        return RecordFrom(Json::parse(file->text));
    } catch (const std::exception& error) {
        throw std::runtime_error(std::string(kRecordPath) +
                                 " cannot be understood: " + error.what());
    }
}

void AdoptionRecord::Save(Hands& hands) const
{
    Json json{{"version", kVersion},
              {"interfaces", Json::array()},
              {"silencers", Json::array()},
              {"units", Json::array()}};
    for (const AdoptedInterface& interface : interfaces) {
        json["interfaces"].push_back(ToJson(interface));
    }
    for (const SilencingFile& file : silencers) {
        json["silencers"].push_back({{"kind", NameIn(kSilencers, file.kind)},
                                     {"path", file.path},
                                     {"device", file.device},
                                     {"before", ToJson(file.before)}});
    }
    for (const ChangedUnit& unit : units) {
        json["units"].push_back(
            {{"unit", unit.unit}, {"enable", unit.enable}, {"before", unit.before}});
    }
    hands.Write(kRecordPath, json.dump(2, ' ', false, Json::error_handler_t::replace) + '\n',
                kPrivateMode);
}

void AdoptionRecord::Forget(Hands& hands)
{
    hands.Remove(kRecordPath);
    hands.RemoveEmptyFolder(kAdoptedFolder);
}

const AdoptedInterface* AdoptionRecord::Find(const std::string& name) const
{
    const auto found =
        std::find_if(interfaces.begin(), interfaces.end(),
                     [&](const AdoptedInterface& each) { return each.name == name; });
    return found == interfaces.end() ? nullptr : &*found;
}

AdoptedInterface* AdoptionRecord::Find(const std::string& name)
{
    return const_cast<AdoptedInterface*>(std::as_const(*this).Find(name));
}

std::set<std::string> AdoptionRecord::NamesIn(std::initializer_list<Phase> phases) const
{
    std::set<std::string> names;
    for (const AdoptedInterface& interface : interfaces) {
        if (std::find(phases.begin(), phases.end(), interface.phase) != phases.end()) {
            names.insert(interface.name);
        }
    }
    return names;
}

} // namespace vornovsctl
