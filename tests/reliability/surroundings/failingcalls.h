/**
 * Calls of this process that change files, and that fail when they are told to: the definitions in
 * the program take the place of the C library's, for the libraries as well.
 */
#ifndef VORNOVS_TESTS_RELIABILITY_SURROUNDINGS_FAILINGCALLS_H
#define VORNOVS_TESTS_RELIABILITY_SURROUNDINGS_FAILINGCALLS_H

namespace reliability {

/** From now on the calls are counted. @return  how many there were. */
void CountFileCalls();
int FileCalls();

/**
 * Has calls fail.
 * @param first   the first one that does, from 1.
 * @param error   the error that it fails with.
 * @param always  all that follow fail, too.
 */
void FailFileCalls(int first, int error, bool always);

} // namespace reliability

#endif
