/**
 * Sees the system calls that make the replacement of a file safe, and makes them fail.
 */
#ifndef VORNOVS_TESTS_UNIT_FILECALLS_H
#define VORNOVS_TESTS_UNIT_FILECALLS_H

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
