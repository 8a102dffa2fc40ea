/**
 * Sees the system calls that the library makes for files, and makes them fail.
 */
#ifndef VORNOVS_TESTS_UNIT_FILECALLS_H
#define VORNOVS_TESTS_UNIT_FILECALLS_H

#include <functional>
#include <string>
#include <vector>

namespace unit {

class FileCalls {
public:
    FileCalls();
    ~FileCalls();
    FileCalls(const FileCalls&) = delete;
    FileCalls& operator=(const FileCalls&) = delete;

    /**
     * Makes calls fail with that error.
     * @param function  fsync, rename, unlink, fchown, fchmod, read or write.
     * @param nth       which call of it, counted from 1; 0: every one.
     */
    void Fail(const std::string& function, int error, int nth = 0);

    /** Makes every write() take a single byte. */
    void WriteSingleBytes();

    /** What a watched write() does instead of failing: it takes a single byte. */
    static constexpr int kShortWrite = -1;

    /**
     * Shows every call that the library makes, none of the harness's, as text: "open-new PATH"
     * (also -empty, -write, -read and -folder), "rename FROM TO", and write, read, fsync, unlink,
     * mkdir, flock, ftruncate, fstat, lstat, fchown and fchmod with the path.
     * @param before  answers the error that the call fails with; 0: it is made.
     * @param after   called when it has been made or has failed; may be empty.
     */
    void Watch(std::function<int(const std::string& call)> before, std::function<void()> after);

    /** The calls of fsync, rename and unlink, files named without folder: "fsync vornovs". */
    const std::vector<std::string>& List() const;
};

/** Takes root's power over file modes from this thread while it lives. */
class ScopedWithoutOverride {
public:
    ScopedWithoutOverride();
    ~ScopedWithoutOverride();
    ScopedWithoutOverride(const ScopedWithoutOverride&) = delete;
    ScopedWithoutOverride& operator=(const ScopedWithoutOverride&) = delete;

private:
    unsigned int m_effective;
};

} // namespace unit

#endif
