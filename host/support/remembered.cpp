#include "remembered.h"

#include "atomicfile.h"
#include "interfacename.h"
#include "keyvaluefile.h"

#include <algorithm>
#include <cctype>
#include <cerrno>
#include <filesystem>
#include <nlohmann/json.hpp>
#include <unistd.h>

namespace vornhost {
namespace {

using nlohmann::json;

constexpr unsigned kVersion = 1;
constexpr char kBonds[] = "bonds";
constexpr char kVlans[] = "vlans";
constexpr char kEnding[] = ".json";

std::string FolderOf(const char* kind)
{
    return std::string(kRememberedFolder) + '/' + kind;
}

std::string PathOf(const char* kind, const std::string& name)
{
    return FolderOf(kind) + '/' + name + kEnding;
}

/**
 * Files of administrators are in any encoding or none, and what is remembered of them is their
 * bytes: each stands as the character of its number.
 */
std::string ToCharacters(const std::string& bytes)
{
    std::string text;
    for (const char each : bytes) {
        const auto byte = static_cast<unsigned char>(each);
        if (byte < 0x80) {
            text += each;
        } else {
            text += static_cast<char>(0xc0U | (byte >> 6U));
            text += static_cast<char>(0x80U | (byte & 0x3fU));
        }
    }
    return text;
}

std::string ToBytes(const std::string& text)
{
    std::string bytes;
    for (std::size_t index = 0; index < text.size(); ++index) {
        const auto first = static_cast<unsigned char>(text[index]);
        if (first < 0x80 || index + 1 == text.size()) {
            bytes += text[index];
            continue;
        }
        ++index;
        const auto second = static_cast<unsigned char>(text[index]);
        bytes += static_cast<char>(((first & 0x03U) << 6U) | (second & 0x3fU));
    }
    return bytes;
}

json ToJson(const FileStates& files)
{
    json object = json::object();
    for (const auto& [interface, file] : files) {
        object[interface] =
            file.text ? json{{"text", ToCharacters(*file.text)}, {"mode", file.mode}} : json();
    }
    return object;
}

FileStates ToFiles(const json& object)
{
    FileStates files;
    for (const auto& [interface, entry] : object.items()) {
        FileState file;
        if (!entry.is_null()) {
            file.text = ToBytes(entry.at("text").get<std::string>());
            file.mode = entry.at("mode").get<unsigned>();
        }
        files[interface] = file;
    }
    return files;
}

json ToJson(const GatewayState& state)
{
    json object{{"interface", state.interface},
                {"family", state.family == AddressFamily::kIPv4 ? 4 : 6}};
    if (state.gateway) {
        object["address"] = state.gateway->address;
        if (state.gateway->metric) {
            object["metric"] = *state.gateway->metric;
        }
    }
    return object;
}

GatewayState ToGateway(const json& object)
{
    GatewayState state;
    state.interface = object.at("interface").get<std::string>();
    state.family = object.at("family") == 4 ? AddressFamily::kIPv4 : AddressFamily::kIPv6;
    if (object.contains("address")) {
        state.gateway = Gateway{object.at("address").get<std::string>(), {}};
        if (object.contains("metric")) {
            state.gateway->metric = object.at("metric").get<unsigned>();
        }
    }
    return state;
}

void Put(const RememberedState& state, json& object)
{
    object["version"] = kVersion;
    object["before"] = ToJson(state.before);
    object["moved"] = ToJson(state.moved);
    object["gateways"] = json::array();
    for (const GatewayState& gateway : state.gateways) {
        object["gateways"].push_back(ToJson(gateway));
    }
}

RememberedState ToState(const json& object)
{
    RememberedState state;
    state.before = ToFiles(object.at("before"));
    state.moved = ToFiles(object.at("moved"));
    for (const json& gateway : object.at("gateways")) {
        state.gateways.push_back(ToGateway(gateway));
    }
    return state;
}

bool SaveJson(const char* kind, const std::string& name, const json& object)
{
    if (!IsInterfaceName(name)) {
        errno = EINVAL;
        return false;
    }
    std::error_code ignored; // the write says what is wrong with the folder
    std::filesystem::create_directories(FolderOf(kind), ignored);
    const auto text = object.dump(2, ' ', false, json::error_handler_t::replace);
    return ReplaceFile(PathOf(kind, name), text + '\n', 0600);
}

/** @return  what the reader makes of the record; nothing when there is none that is whole. */
template <typename Reader>
auto LoadJson(const char* kind, const std::string& name, const Reader& reader)
    -> std::optional<decltype(reader(json()))>
{
    const auto file = IsInterfaceName(name) ? KeyValueFile::Load(PathOf(kind, name)) : std::nullopt;
    if (!file) {
        return std::nullopt;
    }
    try {
        const json object = json::parse(file->Text());
        if (object.at("version") != kVersion || object.at("name") != name) {
            return std::nullopt;
        }
        return reader(object);
    } catch (const json::exception&) {
        return std::nullopt;
    }
}

bool ForgetJson(const char* kind, const std::string& name)
{
    if (!IsInterfaceName(name)) {
        errno = EINVAL;
        return false;
    }
    return ::unlink(PathOf(kind, name).c_str()) == 0 || errno == ENOENT;
}

/** Every record of a kind, sorted by name. */
template <typename Record>
std::vector<Record> LoadRecords(const char* kind)
{
    std::vector<Record> records;
    std::error_code ignored; // no folder: nothing is remembered
    for (const auto& entry : std::filesystem::directory_iterator(FolderOf(kind), ignored)) {
        auto record = entry.path().extension() == kEnding
                          ? Record::Load(entry.path().stem().string())
                          : std::nullopt;
        if (record) {
            records.push_back(std::move(*record));
        }
    }
    std::sort(records.begin(), records.end(),
              [](const auto& one, const auto& other) { return one.name < other.name; });
    return records;
}

} // namespace

bool IsLinkAddress(const std::string& text)
{
    constexpr std::size_t kLength = 17;
    constexpr std::size_t kStep = 3;
    bool valid = text.size() == kLength;
    for (std::size_t at = 0; valid && at < kLength; ++at) {
        const auto byte = static_cast<unsigned char>(text[at]);
        valid = at % kStep == kStep - 1 ? text[at] == ':' : std::isxdigit(byte) != 0;
    }
    return valid;
}

bool RememberedBond::HasSlaves(std::vector<std::string> others) const
{
    std::vector<std::string> own = slaves;
    std::sort(own.begin(), own.end());
    std::sort(others.begin(), others.end());
    return own == others;
}

std::optional<RememberedBond> RememberedBond::Load(const std::string& name)
{
    return LoadJson(kBonds, name, [&](const json& object) {
        RememberedBond bond;
        bond.name = name;
        bond.mac = object.at("mac").get<std::string>();
        if (!IsLinkAddress(bond.mac)) {
            bond.mac.clear(); // it is going to be a word of a command
        }
        bond.mtu = object.at("mtu").get<unsigned>();
        bond.options.values = object.at("options").get<std::map<std::string, std::string>>();
        bond.slaves = object.at("slaves").get<std::vector<std::string>>();
        bond.state = ToState(object);
        return bond;
    });
}

std::vector<RememberedBond> RememberedBond::LoadAll()
{
    return LoadRecords<RememberedBond>(kBonds);
}

bool RememberedBond::Save() const
{
    json object{{"name", name},
                {"mac", mac},
                {"mtu", mtu},
                {"options", options.values},
                {"slaves", slaves}};
    Put(state, object);
    return SaveJson(kBonds, name, object);
}

bool RememberedBond::Forget(const std::string& name)
{
    return ForgetJson(kBonds, name);
}

std::optional<RememberedVlan> RememberedVlan::Load(const std::string& name)
{
    return LoadJson(kVlans, name, [&](const json& object) {
        RememberedVlan vlan;
        vlan.name = name;
        vlan.parent = object.at("parent").get<std::string>();
        vlan.id = object.at("id").get<int>();
        vlan.state = ToState(object);
        return vlan;
    });
}

std::vector<RememberedVlan> RememberedVlan::LoadAll()
{
    return LoadRecords<RememberedVlan>(kVlans);
}

std::vector<RememberedVlan> RememberedVlan::LoadOfParent(const std::string& parent)
{
    auto vlans = LoadAll();
    std::erase_if(vlans, [&](const RememberedVlan& vlan) { return vlan.parent != parent; });
    return vlans;
}

bool RememberedVlan::Save() const
{
    json object{{"name", name}, {"parent", parent}, {"id", id}};
    Put(state, object);
    return SaveJson(kVlans, name, object);
}

bool RememberedVlan::Forget(const std::string& name)
{
    return ForgetJson(kVlans, name);
}

} // namespace vornhost
