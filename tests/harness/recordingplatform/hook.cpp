// The hook framework.
#include "recordingplatform/recorder.h"

#include <vornplatform/hook.h>

#include <gtest/gtest.h>

#include <new>

using harness::CallText;
using harness::PlatformCall;
using harness::Recorder;

namespace vornnetsdk::hook {

struct BaseHook::State {
    std::string category;
    std::string name;
    std::vector<std::string> environment;
};

BaseHook::BaseHook(const std::string& category, const std::string& name)
    : m_state([&] {
          const PlatformCall guard;
          Recorder& recorder = Recorder::Current("BaseHook");
          if (recorder.Housekeeping(CallText("BaseHook", {category, name})).value_or(1) == 0) {
              throw std::bad_alloc();
          }
          auto* const state = new State{category, name, {}};
          recorder.Open(state, "a hook", [state] { delete state; });
          return state;
      }())
{
}

int BaseHook::SetEnv(const std::string& key, const std::string& value)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("SetEnv");
    m_state->environment.push_back(key + "=" + value);
    return recorder.Housekeeping(CallText("SetEnv", {key, value})).value_or(0);
}

bool BaseHook::IsValid()
{
    const PlatformCall guard;
    return Recorder::Current("IsValid").Call("IsValid").value_or(1) != 0;
}

int BaseHook::ExecHook(_tag_sdk_plugin_action_ action)
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("ExecHook");
    std::vector<std::string> words{m_state->category, m_state->name,
                                   std::to_string(static_cast<int>(action))};
    words.insert(words.end(), m_state->environment.begin(), m_state->environment.end());
    return recorder.Call(CallText("ExecHook", words)).value_or(0);
}

BaseHook::~BaseHook()
{
    const PlatformCall guard;
    Recorder& recorder = Recorder::Current("~BaseHook");
    (void)recorder.Housekeeping("~BaseHook");
    if (recorder.Close(m_state, "~BaseHook")) {
        delete m_state;
    }
}

} // namespace vornnetsdk::hook
