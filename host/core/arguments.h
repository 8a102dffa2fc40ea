/**
 * The arguments that a client gives a program.
 */
#ifndef VORNHOST_CORE_ARGUMENTS_H
#define VORNHOST_CORE_ARGUMENTS_H

#include <cstdarg>
#include <string>
#include <vector>

namespace vornhost {

/** @return the program's path and the strings that follow in the list, up to its null. */
inline std::vector<std::string> CollectArguments(const char* path, va_list arguments)
{
    std::vector<std::string> argv = {path};
    while (const char* argument = va_arg(arguments, const char*)) {
        argv.emplace_back(argument);
    }
    return argv;
}

} // namespace vornhost

#endif
