/**
 * The commands, one function each. Where the library's results are 0 on failure too, they look at
 * what holds afterwards.
 */
#ifndef VORNOVSCTL_COMMANDS_H
#define VORNOVSCTL_COMMANDS_H

#include "answer.h"
#include "arguments.h"
#include "terminal.h"

#include <functional>
#include <string>

namespace vornovsctl {

struct Context {
    const Arguments& arguments;
    Terminal terminal;
    /** Says what is about to happen, for commands that take long. */
    std::function<void(const std::string&)> tell;
};

using Perform = Answer (*)(const Context&);

Answer Register(const Context& context);
Answer Unregister(const Context& context);
Answer Status(const Context& context);
Answer Reset(const Context& context);
Answer Show(const Context& context);
Answer Check(const Context& context);
Answer Repair(const Context& context);
Answer Adopt(const Context& context);
Answer Release(const Context& context);

Answer ListInterfaces(const Context& context);
Answer AddInterface(const Context& context);
Answer RemoveInterface(const Context& context);

Answer AttachPort(const Context& context);
Answer DetachPort(const Context& context);

Answer CreateBond(const Context& context);
Answer RemoveBond(const Context& context);
Answer GetBond(const Context& context);
Answer ChangeBondMode(const Context& context);
Answer FreeBondName(const Context& context);
Answer ListBondModes(const Context& context);

Answer GetVlan(const Context& context);
Answer SetVlan(const Context& context);
Answer ClearVlan(const Context& context);
Answer CreateVlan(const Context& context);
Answer RemoveVlan(const Context& context);

Answer StartSwitch(const Context& context);
Answer StopSwitch(const Context& context);
Answer StartNetwork(const Context& context);
Answer StopNetwork(const Context& context);
Answer CopyGateway(const Context& context);
Answer RemoveGateway(const Context& context);

} // namespace vornovsctl

#endif
