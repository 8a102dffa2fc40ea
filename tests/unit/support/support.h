/**
 * What the unit tests share. Before each test the folders that the library writes to are made anew,
 * empty; the tests run in the sandbox, so these are not the machine's.
 */
#ifndef VORNOVS_TESTS_UNIT_SUPPORT_H
#define VORNOVS_TESTS_UNIT_SUPPORT_H

#include "recordingplatform/recordingplatform.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <initializer_list>
#include <map>
#include <optional>
#include <set>
#include <string>
#include <vector>

namespace unit {

using Names = std::set<std::string>;
using Calls = std::vector<std::string>;
using LogLines = std::vector<harness::LogLine>;
using BondModes = std::map<std::string, std::string>;

constexpr char kStateParent[] = "/usr/vorn/etc";
constexpr char kStateFolder[] = "/usr/vorn/etc/vornovs";
constexpr char kRegistry[] = "/usr/vorn/etc/vornovs/ovs_reg.conf";
constexpr char kInterfaceList[] = "/usr/vorn/etc/vornovs/ovs_interface.conf";
constexpr char kIgnoreList[] = "/usr/vorn/etc/vornovs/ovs_ignore.conf";
constexpr char kIfcfg[] = "/etc/sysconfig/network-scripts/ifcfg-";

// Wait statuses of a program.
constexpr int kExitedWith1 = 1 << 8;
constexpr int kExitedWith77 = 77 << 8;
constexpr int kKilled = 9;

/** Makes the folders anew in the middle of a test. */
void RenewFolders();

/** The longest name that every entry point must stand. */
const std::string& LongName();

void WriteFile(const std::string& path, const std::string& text);

/** The file's content, or nothing when there is no file. */
std::optional<std::string> ReadFile(const std::string& path);

/** What stands between white space. */
std::vector<std::string> Words(const std::string& text);

/** The names in a folder, sorted. */
std::vector<std::string> ListFolder(const std::string& path);

/** Puts a socket at the path: it exists, but opening it fails for everyone, root included. */
void MakeUnopenable(const std::string& path);

/** An IPv4 and an IPv6 gateway copied with the gateway tool. */
Calls GatewaysCopied(const std::string& from, const std::string& to);

/** The interface list is loaded for an edit. */
Calls InterfaceListLoaded();

/** The whole conversion of one interface's files. */
Calls BridgeMade(const std::string& name);

/** The whole conversion back of one bridge's files; `listed`: the interface list is rewritten. */
Calls BridgeDissolved(const std::string& name, bool listed);

/** The pieces one after the other. */
Calls Sequence(std::initializer_list<Calls> pieces);

/** A folder that is a small file system of its own while this lives. */
class ScopedMount {
public:
    /** @param options  such as "size=8k". */
    ScopedMount(std::string folder, const std::string& options);
    ~ScopedMount();
    ScopedMount(const ScopedMount&) = delete;
    ScopedMount& operator=(const ScopedMount&) = delete;
    void MakeReadOnly();

private:
    std::string m_folder;
};

} // namespace unit

#endif
