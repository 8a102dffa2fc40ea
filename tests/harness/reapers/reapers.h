/**
 * Ways of clients to take every child's status, also of those that a library started.
 */
#pragma once

namespace harness {

/** A handler of SIGCHLD that takes the status of every child that has ended. */
void ReapAll(int signal);

/** Starts a thread that takes every child's status until the process ends. */
void ReapForEver();

} // namespace harness
