/**
 * What takes a bond of the switch apart: it reads the slave list of the bond's file and edits the
 * files of all concerned. The text is the bond's file.
 */
#include "subject.h"
#include "text.h"

#include "support/keyvaluefile.h"

#include <vornovs/vornovs.h>
#include <vornplatform/netsdk.h>

#include <cstring>

namespace {

using fuzz::Expect;
using vornhost::KeyValueFile;

constexpr char kFolder[] = "/etc/sysconfig/network-scripts";
constexpr char kBond[] = "ovs_bond0";
constexpr std::size_t kLongestValue = 1023;

std::string PathOf(const std::string& name)
{
    return std::string(kFolder) + "/ifcfg-" + name;
}

/** The slaves that a list names; none at all when one of them cannot be an interface. */
std::vector<std::string> Listed(const KeyValueFile& file)
{
    const std::string value = file.Get("SLAVE_LIST").value_or("");
    std::string text = value.size() > kLongestValue ? "" : value.c_str();
    text.resize(std::min(text.find_last_not_of(" \t\n\v\f\r") + 1, text.size()));
    text.erase(0, text.find_first_not_of(" \t\n\v\f\r"));
    const std::vector<std::string> slaves = fuzz::WordsOf(text);
    for (const std::string& slave : slaves) {
        if (slave.size() >= VORN_NAME_SIZE) {
            return {};
        }
    }
    return slaves.size() > VORN_LINK_AGGR_SLAVES ? std::vector<std::string>() : slaves;
}

void ExpectRecord(const VORNLINKAGGROPT& record, const std::vector<std::string>& slaves)
{
    Expect(std::string(record.szMaster) == kBond, "the record is of another bond");
    Expect(record.nSlave == static_cast<int>(slaves.size()), "the record counts wrong");
    for (std::size_t at = 0; at < slaves.size(); ++at) {
        Expect(std::string(record.rgszSlave[at]) == slaves[at], "a slave has another name");
    }
}

/** The bridge of the first slave has the bond's file now, but for what makes it a bond's. */
void ExpectFiles(KeyValueFile file, const std::string& slave)
{
    Expect(!fuzz::Exists(PathOf(kBond)), "the bond's file is still there");
    const std::string bridge = std::string("ovs_") + slave;
    (void)file.Set("DEVICE", bridge);
    for (const char* key : {"BONDING_OPTS", "SLAVE_LIST", "BOND_MODE", "SLAVE"}) {
        (void)file.Remove(key);
    }
    Expect(fuzz::ReadFile(PathOf(bridge)) == file.Text(), "the bridge's file holds another text");
}

void Run(std::string_view text)
{
    fuzz::MakeEmptyFolder(kFolder);
    fuzz::WriteFile(PathOf(kBond), text);
    const KeyValueFile file = KeyValueFile::Parse(std::string(text));
    const std::vector<std::string> slaves = Listed(file);
    for (const std::string& slave : slaves) {
        if (slave.find_first_of("/\t\n\v\f\r") != std::string::npos) {
            return; // no interface is called so
        }
        if (slave == kBond) {
            return; // its file is the bond's, which is looked at afterwards
        }
        fuzz::WriteFile(PathOf(slave), "SLAVE=yes\nMASTER=bond0\n");
    }

    const std::string mode = file.Get("BOND_MODE").value_or("");
    const bool whole = slaves.size() > 1 && file.Get("BOND_MODE") && mode.size() <= kLongestValue;
    VORNLINKAGGROPT record{};
    Expect(VORN::OVS::BondManager::Remove(kBond, &record, false) == whole,
           "a bond was taken apart without its slaves, or was not with them");
    if (whole) {
        ExpectRecord(record, slaves);
        ExpectFiles(file, slaves.front());
    } else {
        Expect(fuzz::ReadFile(PathOf(kBond)) == text, "a file that was refused was edited");
    }
}

const fuzz::Subject kSubject("slave_list", Run);

} // namespace
