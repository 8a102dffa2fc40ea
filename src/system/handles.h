#ifndef VORNOVS_SYSTEM_HANDLES_H
#define VORNOVS_SYSTEM_HANDLES_H

#include <vornplatform/core.h>

#include <unistd.h>

#include <cstdio>
#include <utility>

namespace VORN::OVS {

constexpr int kHashSize = 1024;
constexpr int kListSize = 512;

// The option word of the platform's standard way of running a system script.
constexpr int kExecOptions = 0xBB;

class SzHash {
public:
    SzHash() : m_hash(VLIBCSzHashAlloc(kHashSize)) {}
    ~SzHash()
    {
        if (m_hash != nullptr) {
            VLIBCSzHashFree(m_hash);
        }
    }
    SzHash(const SzHash&) = delete;
    SzHash& operator=(const SzHash&) = delete;

    explicit operator bool() const { return m_hash != nullptr; }
    [[nodiscard]] VLIBCSzHash* Get() const { return m_hash; }

    // The platform may move the hash as it grows, so it is handed our handle's address. It
    // remembers an insert that failed and then refuses to write the hash.
    void Set(const char* key, const char* value) { (void)VLIBCSzHashSetValue(&m_hash, key, value); }

private:
    VLIBCSzHash* m_hash;
};

class SzList {
public:
    SzList() : m_list(VLIBCSzListAlloc(kListSize)) {}
    ~SzList()
    {
        if (m_list != nullptr) {
            VLIBCSzListFree(m_list);
        }
    }
    SzList(const SzList&) = delete;
    SzList& operator=(const SzList&) = delete;

    explicit operator bool() const { return m_list != nullptr; }
    [[nodiscard]] int Count() const { return m_list->nItem; }
    /** @return the item at an index below the count; the list keeps it. */
    [[nodiscard]] const char* At(int index) const { return VLIBCSzListGet(m_list, index); }

    // As with the hash, the platform may move the list as it grows.
    void Split(const char* text, const char* separator)
    {
        (void)VLIBCStrSep(text, separator, &m_list);
    }

private:
    VLIBCSzList* m_list;
};

/** The readable output of a program. */
class Pipe {
public:
    explicit Pipe(FILE* stream) : m_stream(stream) {}
    ~Pipe() { (void)Close(); }
    Pipe(const Pipe&) = delete;
    Pipe& operator=(const Pipe&) = delete;

    explicit operator bool() const { return m_stream != nullptr; }
    [[nodiscard]] FILE* Get() const { return m_stream; }

    /** Waits for the program. @return its wait status; 0 when the pipe is closed already. */
    int Close()
    {
        FILE* const stream = std::exchange(m_stream, nullptr);
        return stream == nullptr ? 0 : VLIBCPclose(stream);
    }

private:
    FILE* m_stream;
};

/** An open file. */
class File {
public:
    explicit File(int descriptor) : m_descriptor(descriptor) {}
    ~File()
    {
        if (m_descriptor >= 0) {
            (void)::close(m_descriptor);
        }
    }
    File(const File&) = delete;
    File& operator=(const File&) = delete;

    explicit operator bool() const { return m_descriptor >= 0; }
    [[nodiscard]] int Get() const { return m_descriptor; }

private:
    int m_descriptor;
};

} // namespace VORN::OVS

#endif
