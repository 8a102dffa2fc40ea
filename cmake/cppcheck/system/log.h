// Stands in for src/system/log.h when cppcheck reads the sources: it does not know __VA_OPT__.
#ifndef VORNOVS_SYSTEM_LOG_H
#define VORNOVS_SYSTEM_LOG_H

#include <syslog.h>

#define OVS_LOG(priority, ...) ::syslog((priority), __VA_ARGS__)
#define OVS_ERR(...) ::syslog(LOG_ERR, __VA_ARGS__)
#define OVS_INFO(...) ::syslog(LOG_INFO, __VA_ARGS__)

#endif
