/**
 * A host made of recorded files and answers of programs, in a folder of its own.
 */
#ifndef VORNOVS_TESTS_UNIT_TOOLS_ADOPT_RECORDEDHOST_H
#define VORNOVS_TESTS_UNIT_TOOLS_ADOPT_RECORDEDHOST_H

#include <adopt/hostview.h>
#include <map>
#include <string>

namespace unit {

class RecordedHost {
public:
    RecordedHost();
    ~RecordedHost();
    RecordedHost(const RecordedHost&) = delete;
    RecordedHost& operator=(const RecordedHost&) = delete;

    vornovsctl::HostView view;

    const std::string& Root() const { return view.root; }
    /** Writes a file of the host. */
    void Write(const std::string& path, const std::string& text) const;
    /** @return the text of a file of the host, "(none)" where there is none. */
    std::string Read(const std::string& path) const;
    /** Every file below a folder with its text. */
    std::map<std::string, std::string> Files() const;
    /** What a program answers to this command line; without, it fails. */
    void Answer(const std::string& commandLine, const std::string& text);

    /** Adds an interface, and what is on it. @return its index. */
    int AddLink(const std::string& name, const std::string& mac, const std::string& kind = "");
    vornhost::Link& Link(const std::string& name);
    void AddAddress(const std::string& interface, const std::string& address, unsigned prefixLength,
                    bool lasting = true);
    void AddDefaultRoute(const std::string& interface, const std::string& gateway, unsigned metric);

private:
    std::map<std::string, std::string> m_answers;
};

/** @return a recorded text, such as "networkd/list.json". */
std::string Recorded(const std::string& name);

} // namespace unit

#endif
