#include "conversionrecord.h"

#include "atomicfile.h"
#include "contains.h"
#include "keyvaluefile.h"

#include <cerrno>
#include <filesystem>
#include <nlohmann/json.hpp>
#include <unistd.h>

namespace vornhost {

void ConversionRecord::Add(const ConversionRecord& other)
{
    bonds.insert(other.bonds.begin(), other.bonds.end());
    for (const FileVlan& vlan : other.vlans) {
        if (!Contains(vlans, vlan)) {
            vlans.push_back(vlan);
        }
    }
}

std::optional<ConversionRecord> ConversionRecord::Load()
{
    const auto file = KeyValueFile::Load(kConversionPath);
    if (!file) {
        return errno == ENOENT ? std::optional<ConversionRecord>(ConversionRecord{}) : std::nullopt;
    }
    ConversionRecord record;
    try {
        const auto object = nlohmann::json::parse(file->Text());
        for (const auto& [name, bond] : object.at("bonds").items()) {
            record.bonds[name] = {bond.at("mode").get<std::string>(),
                                  bond.at("slaves").get<std::vector<std::string>>()};
        }
        for (const auto& vlan : object.at("vlans")) {
            record.vlans.push_back(
                {vlan.at("parent").get<std::string>(), vlan.at("id").get<unsigned>()});
        }
    } catch (const nlohmann::json::exception&) {
        errno = EINVAL;
        return std::nullopt;
    }
    return record;
}

bool ConversionRecord::Save() const
{
    if (Empty()) {
        return ::unlink(kConversionPath) == 0 || errno == ENOENT;
    }
    nlohmann::json object{{"bonds", nlohmann::json::object()}, {"vlans", nlohmann::json::array()}};
    for (const auto& [name, bond] : bonds) {
        object["bonds"][name] = {{"mode", bond.mode}, {"slaves", bond.slaves}};
    }
    for (const FileVlan& vlan : vlans) {
        object["vlans"].push_back({{"parent", vlan.parent}, {"id", vlan.id}});
    }
    const std::filesystem::path path = kConversionPath;
    std::error_code ignored; // the write says what is wrong with the folder
    std::filesystem::create_directories(path.parent_path(), ignored);
    return ReplaceFile(path, object.dump(1) + "\n", kPrivateFile);
}

} // namespace vornhost
