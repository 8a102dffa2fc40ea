/**
 * Owner of a file descriptor.
 */
#ifndef VORNHOST_SUPPORT_DESCRIPTOR_H
#define VORNHOST_SUPPORT_DESCRIPTOR_H

#include <utility>

#include <fcntl.h>
#include <unistd.h>

namespace vornhost {

/** Closes its descriptor, if it has one, when it goes. */
class Descriptor {
public:
    Descriptor() = default;
    explicit Descriptor(int descriptor) : m_descriptor(descriptor) {}
    Descriptor(Descriptor&& other) noexcept : m_descriptor(other.Release()) {}
    Descriptor& operator=(Descriptor&& other) noexcept
    {
        Reset(other.Release());
        return *this;
    }
    Descriptor(const Descriptor&) = delete;
    Descriptor& operator=(const Descriptor&) = delete;
    ~Descriptor() { Reset(); }

    explicit operator bool() const { return m_descriptor >= 0; }
    int Get() const { return m_descriptor; }
    int Release() { return std::exchange(m_descriptor, -1); }
    void Reset(int descriptor = -1)
    {
        if (m_descriptor >= 0) {
            ::close(m_descriptor);
        }
        m_descriptor = descriptor;
    }

private:
    int m_descriptor = -1;
};

/**
 * Moves a descriptor out of the way: where a client has closed its standard descriptors, a file
 * that we open becomes one of them, and what the client prints would be written into it.
 * @return the same or a new one, none when there was none or none is left.
 */
inline Descriptor AboveStandard(Descriptor descriptor)
{
    constexpr int kFirst = 3;
    if (!descriptor || descriptor.Get() >= kFirst) {
        return descriptor;
    }
    return Descriptor(::fcntl(descriptor.Get(), F_DUPFD_CLOEXEC, kFirst));
}

} // namespace vornhost

#endif
