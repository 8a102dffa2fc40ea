#include "support/sharedhost.h"

#include <cstring>
#include <new>
#include <stdexcept>
#include <type_traits>
#include <utility>

#include <sys/mman.h>

namespace reliability {

namespace {

using unit::SimulatedState;

/** Writes values one after the other as text, each with its length. */
class Packer {
public:
    void Add(const std::string& value) { m_text += std::to_string(value.size()) + ":" + value; }
    void Add(int value) { Add(std::to_string(value)); }
    template <typename Key, typename Value>
    void Add(const std::pair<Key, Value>& pair)
    {
        Add(pair.first);
        Add(pair.second);
    }
    void Add(const SimulatedState::Bridge& bridge)
    {
        Add(bridge.tag);
        Add(bridge.ports);
    }
    void Add(const SimulatedState::LinuxBond& bond)
    {
        Add(bond.mode);
        Add(bond.slaves);
    }
    void Add(const SimulatedState::LinuxVlan& vlan)
    {
        Add(vlan.parent);
        Add(vlan.id);
    }
    void Add(const SimulatedState::Memory& memory)
    {
        Add(memory.mode);
        Add(memory.before);
        Add(memory.left);
    }
    template <typename List>
    std::enable_if_t<!std::is_arithmetic_v<List>> Add(const List& list)
    {
        Add(static_cast<int>(list.size()));
        for (const auto& each : list) {
            Add(each);
        }
    }
    [[nodiscard]] const std::string& Text() const { return m_text; }

private:
    std::string m_text;
};

/** Reads them back. */
class Unpacker {
public:
    explicit Unpacker(std::string text) : m_text(std::move(text)) {}

    void Take(std::string& value)
    {
        const std::size_t colon = m_text.find(':', m_at);
        const std::size_t size = std::stoul(m_text.substr(m_at, colon - m_at));
        value = m_text.substr(colon + 1, size);
        m_at = colon + 1 + size;
    }
    void Take(int& value)
    {
        std::string text;
        Take(text);
        value = std::stoi(text);
    }
    void Take(SimulatedState::Bridge& bridge)
    {
        Take(bridge.tag);
        Take(bridge.ports);
    }
    void Take(SimulatedState::LinuxBond& bond)
    {
        Take(bond.mode);
        Take(bond.slaves);
    }
    void Take(SimulatedState::LinuxVlan& vlan)
    {
        Take(vlan.parent);
        Take(vlan.id);
    }
    void Take(SimulatedState::Memory& memory)
    {
        Take(memory.mode);
        Take(memory.before);
        Take(memory.left);
    }
    template <typename Value>
    void Take(std::map<std::string, Value>& map)
    {
        int size = 0;
        Take(size);
        for (; size > 0; --size) {
            std::string key;
            Take(key);
            Take(map[key]);
        }
    }
    template <typename List>
    void Take(List& list)
    {
        int size = 0;
        Take(size);
        for (; size > 0; --size) {
            std::string value;
            Take(value);
            list.insert(list.end(), value);
        }
    }

private:
    std::string m_text;
    std::size_t m_at = 0;
};

std::string Pack(const SimulatedState& state)
{
    Packer packer;
    packer.Add(state.cards);
    packer.Add(state.bridges);
    packer.Add(state.linuxBonds);
    packer.Add(state.linuxVlans);
    packer.Add(state.memories);
    return packer.Text();
}

SimulatedState Unpack(const std::string& text)
{
    Unpacker unpacker(text);
    SimulatedState state;
    unpacker.Take(state.cards);
    unpacker.Take(state.bridges);
    unpacker.Take(state.linuxBonds);
    unpacker.Take(state.linuxVlans);
    unpacker.Take(state.memories);
    return state;
}

} // namespace

SharedHost::SharedHost()
{
    void* const memory =
        ::mmap(nullptr, sizeof(Memory), PROT_READ | PROT_WRITE, MAP_SHARED | MAP_ANONYMOUS, -1, 0);
    if (memory == MAP_FAILED) {
        throw std::bad_alloc();
    }
    m_memory = static_cast<Memory*>(memory);
    pthread_mutexattr_t attributes;
    (void)::pthread_mutexattr_init(&attributes);
    (void)::pthread_mutexattr_setpshared(&attributes, PTHREAD_PROCESS_SHARED);
    (void)::pthread_mutexattr_setrobust(&attributes, PTHREAD_MUTEX_ROBUST);
    (void)::pthread_mutex_init(&m_memory->mutex, &attributes);
    (void)::pthread_mutexattr_destroy(&attributes);
}

SharedHost::~SharedHost()
{
    (void)::munmap(m_memory, sizeof(Memory));
}

void SharedHost::Set(const unit::SimulatedState& state)
{
    Write(Pack(state));
}

unit::SimulatedState SharedHost::Get() const
{
    return Unpack(std::string(m_memory->text, m_memory->size));
}

void SharedHost::Enter(unit::SimulatedHost& host)
{
    if (::pthread_mutex_lock(&m_memory->mutex) == EOWNERDEAD) {
        (void)::pthread_mutex_consistent(&m_memory->mutex);
    }
    if (m_seen != m_memory->changes) {
        host.Become(Get());
        m_seen = m_memory->changes;
    }
}

void SharedHost::Leave(const unit::SimulatedHost& host)
{
    const std::string text = Pack(host);
    if (text != std::string_view(m_memory->text, m_memory->size)) {
        Write(text);
        m_seen = m_memory->changes;
    }
    (void)::pthread_mutex_unlock(&m_memory->mutex);
}

void SharedHost::Write(const std::string& text)
{
    if (text.size() > kCapacity) {
        throw std::length_error("a simulated host too large to share");
    }
    std::memcpy(m_memory->text, text.data(), text.size());
    m_memory->size = text.size();
    ++m_memory->changes;
}

} // namespace reliability
