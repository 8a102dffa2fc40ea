/**
 * What ifupdown is told of an interface, as a wish.
 */
#ifndef VORNOVSCTL_ADOPT_IFUPDOWNREADER_H
#define VORNOVSCTL_ADOPT_IFUPDOWNREADER_H

#include "adopt/hostview.h"
#include "adopt/interfacesfile.h"
#include "adopt/wish.h"

namespace vornovsctl {

constexpr char kInterfacesPath[] = "/etc/network/interfaces";

InterfacesConfig ReadInterfaces(const HostView& host);

/** @return the wish for one interface, with obstacles where it cannot be carried over. */
Wish ReadIfupdown(const HostView& host, const InterfacesConfig& config, const std::string& name);

} // namespace vornovsctl

#endif
