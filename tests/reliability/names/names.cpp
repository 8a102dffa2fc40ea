#include "names/names.h"

#include <array>
#include <cstdio>

namespace reliability {
namespace {

std::string Repeated(const std::string& text, size_t size)
{
    std::string repeated;
    while (repeated.size() < size) {
        repeated += text;
    }
    repeated.resize(size);
    return repeated;
}

/** Names that lead elsewhere. */
std::vector<std::string> Paths()
{
    return {"",        ".",          "..",          "/",           "//",         "../..",
            "./eth0",  "../eth0",    "eth0/",       "eth0/../lo",  "a/b",        "/etc/passwd",
            "/tmp/x",  "../../../x", "../fstab",    "/dev/full",   "/dev/zero",  "lo/../../../..",
            "eth0/..", "...",        ".vornovs-XX", "ifcfg-eth0",  "..\\..\\x",  "ovs_reg.conf.new",
            "~",       "~root",      "/proc/self",  "/run/fake/x", "\\\\host\\x"};
}

/** Names that programs could take for options or for other words of their language. */
std::vector<std::string> Words()
{
    return {"-",
            "--",
            "---",
            "-h",
            "--help",
            "--version",
            "--dry-run",
            "--boot",
            "-f",
            "-t",
            "-rf",
            "--no-wait",
            "--db=tcp:1",
            "--if-exists",
            "--timeout=1",
            "--may-exist",
            "-4",
            "-6",
            "--json",
            "-v",
            "--copy-gateway-info",
            "--del-gateway-info",
            "--list-gateway-info",
            "--target-directory=/tmp",
            "--verbose=dbg",
            "start",
            "stop",
            "set-ovs-bond",
            "wait-online",
            "del-br",
            "get",
            "tag",
            "tag=5",
            "[]",
            "[",
            "{}",
            "@new",
            "@",
            "a=b",
            "DEVICE=x",
            "TYPE=OVS",
            "=",
            "=a",
            "a=",
            "#",
            "#eth0",
            ";",
            ":",
            "eth0:1"};
}

/** Names that a shell or a format would do something with. */
std::vector<std::string> Programs()
{
    return {"%n%s%n",
            "%s%s%s%s",
            "%",
            "%%",
            "%d",
            "%99999999d",
            "\\",
            "\\n",
            "'",
            "\"",
            "`",
            "''",
            "\"\"",
            "'\"'",
            "`touch /ran`",
            "$(touch /ran)",
            "${IFS}",
            "$HOME",
            "$",
            ";touch /ran",
            "|touch /ran",
            "&touch /ran",
            ">/ran",
            "</etc/passwd",
            "*",
            "?",
            "[a-z]*",
            "{a,b}",
            "!!",
            "^",
            "a;b",
            "a&&b",
            "a||b",
            "(",
            ")",
            "<>"};
}

/** Bytes that end lines, are no letters, or are in no encoding. */
std::vector<std::string> Bytes()
{
    std::vector<std::string> names = {"\n",
                                      "a\nb",
                                      "\na",
                                      "a\n",
                                      "\n\n",
                                      "a\nkeeper",
                                      "\t",
                                      "a\tb",
                                      "\r",
                                      "a\rb",
                                      "a\r\n",
                                      "\v",
                                      "\f",
                                      "\a",
                                      "\b",
                                      "\x1b[2J",
                                      "\x7f",
                                      " ",
                                      "  ",
                                      "a b",
                                      " a",
                                      "a ",
                                      "\xff",
                                      "\xfe\xff",
                                      "\x80",
                                      "\xc3\x28",
                                      "\xc0\xaf",
                                      "\xed\xa0\x80",
                                      "\xf0\x9f\x92\xbe",
                                      "\xc3\xbc",
                                      "\xe2\x80\xae",
                                      "e\xcc\x81",
                                      "\x01",
                                      "\x1f"};
    names.push_back(std::string("eth0\0evil", 9));
    names.push_back(std::string("\0", 1));
    return names;
}

/** Names that mean something here. */
std::vector<std::string> Known()
{
    return {"lo",     "all",     "default",       "eth0", "bond0", "ovs-system",
            "ovs_",   "OVS_x",   "wlan0",         "ppp0", "tun0",  "keeper",
            "client", "802.3ad", "active-backup", "0",    "1",     "4094",
            "4095",   "-1",      "4294967296",    "0x10", "5,6",   "1 2"};
}

std::vector<std::string> Lengths()
{
    std::vector<std::string> names;
    constexpr std::array<size_t, 18> kSizes = {11,  12,  14,  15,   16,   17,   20,   248,  249,
                                               250, 255, 256, 1023, 1024, 1025, 4095, 4096, 5000};
    for (const size_t size : kSizes) {
        names.push_back(Repeated("x", size));
    }
    names.push_back(Repeated("../", 5000));
    names.push_back(Repeated("/x", 1024));
    names.push_back(Repeated("%s", 1024));
    names.push_back(Repeated(" x", 5000));
    return names;
}

} // namespace

std::vector<std::string> Names()
{
    std::set<std::string> names;
    for (const auto& list : {Paths(), Words(), Programs(), Bytes(), Known(), Lengths()}) {
        for (const std::string& seed : list) {
            names.insert({seed, "ovs_" + seed});
            if (seed.size() < 4) {
                names.insert({"eth0" + seed, "ovs_ovs_" + seed});
            }
        }
    }
    return {names.begin(), names.end()};
}

std::set<std::string> InterfacesOf(const std::string& name)
{
    const std::string text = name.c_str(); // it ends at a NUL
    std::set<std::string> interfaces = {text, "ovs_" + text};
    if (text.starts_with("ovs_")) {
        const size_t begin = text.find_first_not_of(" \t\n\v\f\r", 4);
        const size_t end = text.find_first_of(" \t\n\v\f\r", begin);
        const std::string plain = begin == std::string::npos ? "" : text.substr(begin, end - begin);
        interfaces.insert({plain, "ovs_" + plain});
    }
    return interfaces;
}

std::string Printable(const std::string& name)
{
    constexpr size_t kShown = 60;
    std::string text;
    for (const char letter : name.substr(0, kShown)) {
        const auto byte = static_cast<unsigned char>(letter);
        char escaped[8] = {letter};
        if (byte < ' ' || byte > '~' || letter == '\\') {
            (void)std::snprintf(escaped, sizeof escaped, "\\x%02x", byte);
        }
        text += escaped;
    }
    return "\"" + text + "\" of " + std::to_string(name.size()) + " bytes";
}

} // namespace reliability
