/**
 * Reads the keys of one interface's file; behind ParseInterfaceFile().
 */
#ifndef VORNHOST_SUPPORT_INTERFACEPARSER_H
#define VORNHOST_SUPPORT_INTERFACEPARSER_H

#include "interfacefile.h"

#include <map>
#include <optional>
#include <string>

namespace vornhost {

constexpr char kInterfaceFilePrefix[] = "ifcfg-";

/** Reads the keys of one file and keeps what there is to say about them. */
class InterfaceParser {
public:
    InterfaceParser(const std::string& name, const std::string& text)
        : m_file(KeyValueFile::Parse(text)), m_values(m_file.Values())
    {
        m_parsed.file.name = name;
        // A file without its last line break may be one that is being written.
        m_parsed.file.whole = !text.empty() && text.back() == '\n';
    }

    ParsedFile Parse();

private:
    std::string Value(const std::string& key) const;
    std::string FileName() const { return kInterfaceFilePrefix + m_parsed.file.name; }
    void Leave(const std::string& reason);
    void Refuse(const std::string& key, const std::string& reason);
    std::optional<bool> YesOrNo(const std::string& key);
    std::optional<unsigned> Number(const std::string& key, unsigned least, unsigned most);
    std::string Hex(const std::string& key, size_t least, size_t most);

    // interfacefile.cpp: what kind of file it is
    bool IsOwnFile();
    void ReadStructure();
    void ReadSlaves();
    void ReadBondOptions();
    void ReadVlan();
    std::string ProtocolProblem() const;
    void DecideUse();
    void ReadLinkKeys();
    void ReadLinkCommands();

    // interfaceaddressing.cpp: addresses, routes and where they come from
    void ReadAddressing();
    void ReadIpv4();
    void ReadIpv4Address(const std::string& number);
    void ReadIpv6();
    void ReadIpv6Address(const std::string& key, const std::string& text);
    void ReadIpv6Identity();
    void ReadPrivacy();
    std::string ReadGateway(const std::string& key, int family);
    void ReadClient();
    void ReadClientIdentity();
    void ReadResolver();
    void ReadRoutes();

    KeyValueFile m_file;
    std::map<std::string, std::string> m_values; // read once: hundreds of keys are asked for
    ParsedFile m_parsed;
};

} // namespace vornhost

#endif
