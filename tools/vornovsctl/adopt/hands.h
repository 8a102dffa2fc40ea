/**
 * What changes a host: its files, and programs that do something. Tests put another one below, or
 * let one die half-way.
 */
#ifndef VORNOVSCTL_ADOPT_HANDS_H
#define VORNOVSCTL_ADOPT_HANDS_H

#include <optional>
#include <string>
#include <sys/types.h>
#include <vector>

namespace vornovsctl {

constexpr unsigned kReadableMode = 0644;
constexpr unsigned kPrivateMode = 0600; // files of managers may hold secrets

/** A file as it is: what it takes to make it again. */
struct SavedFile {
    std::string text;
    unsigned mode = 0;
    unsigned user = 0;
    unsigned group = 0;

    bool operator==(const SavedFile&) const = default;
};

class Hands {
public:
    explicit Hands(std::string root = "") : m_root(std::move(root)) {}
    virtual ~Hands() = default;
    Hands(const Hands&) = delete;
    Hands& operator=(const Hands&) = delete;

    /** @return nothing: there is no such file. */
    std::optional<SavedFile> Read(const std::string& path) const;

    /** Replaces a file or makes it, with its folder. @throws std::runtime_error when it cannot. */
    virtual void Write(const std::string& path, const std::string& text, unsigned mode);
    /** Makes a file what it was. @throws std::runtime_error when it cannot. */
    virtual void Restore(const std::string& path, const SavedFile& file);
    /** @throws std::runtime_error when it is still there. */
    virtual void Remove(const std::string& path);
    /** Removes a folder if nothing is in it. */
    virtual void RemoveEmptyFolder(const std::string& path);
    /** Runs a program. @return whether it succeeded. */
    bool Run(const std::vector<std::string>& argv) { return Feed(argv, ""); }
    /** Runs a program that reads a text. @return whether it succeeded. */
    virtual bool Feed(const std::vector<std::string>& argv, const std::string& input);
    /** Ends the process that a file names if it is of that program, without letting it say so. */
    virtual void EndProcess(const std::string& pidFile, const std::string& program);

private:
    std::string m_root;
};

} // namespace vornovsctl

#endif
