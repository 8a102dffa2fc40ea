/**
 * The object SDK platform library, libvornnetsdkcpp: the hook framework.
 */
#ifndef VORNPLATFORM_HOOK_H
#define VORNPLATFORM_HOOK_H

#include <vornplatform/records.h>

#include <string>

namespace vornnetsdk {
namespace hook {

/** A hook: a named set of programs that are run when something is announced. */
class BaseHook {
public:
    /** @param name  such as "net/ovs_change": the folder of the programs. */
    BaseHook(const std::string& category, const std::string& name);
    BaseHook(const BaseHook&) = delete;
    BaseHook& operator=(const BaseHook&) = delete;

    /** Adds a variable to the environment of the hook's programs. @return 0, negative: failed. */
    int SetEnv(const std::string& key, const std::string& value);

    /** @return whether the hook can be run. */
    virtual bool IsValid();

    /** Runs the hook's programs, one after the other. @return 0, negative: a program failed. */
    int ExecHook(_tag_sdk_plugin_action_ action);

    virtual ~BaseHook();

private:
    struct State;
    State* m_state;
};

} // namespace hook
} // namespace vornnetsdk

#endif
