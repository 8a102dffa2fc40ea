#ifndef VORNOVS_SYSTEM_LOG_H
#define VORNOVS_SYSTEM_LOG_H

#include <syslog.h>

// Log readers match on the source file's name, so every source file defines its own kLogFile.
#define OVS_LOG(priority, message, ...)                                                            \
    ::syslog((priority), "%s:%d " message, kLogFile, __LINE__ __VA_OPT__(, ) __VA_ARGS__)
#define OVS_ERR(message, ...) OVS_LOG(LOG_ERR, message __VA_OPT__(, ) __VA_ARGS__)
#define OVS_INFO(message, ...) OVS_LOG(LOG_INFO, message __VA_OPT__(, ) __VA_ARGS__)

#endif
