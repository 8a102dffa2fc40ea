#ifndef VORNOVS_API_CONFIGLOCK_H
#define VORNOVS_API_CONFIGLOCK_H

namespace VORN::OVS {

/** The lock that serialises every call that changes the switch's configuration; held for a scope.
 */
class ConfigLock {
public:
    ConfigLock();
    ~ConfigLock();
    ConfigLock(const ConfigLock&) = delete;
    ConfigLock& operator=(const ConfigLock&) = delete;

    explicit operator bool() const { return m_taken; }

private:
    int m_handle = -1;
    bool m_taken;
};

} // namespace VORN::OVS

#endif
