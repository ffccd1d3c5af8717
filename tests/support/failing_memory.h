// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TESTS_SUPPORT_FAILING_MEMORY_H
#define QUO_TESTS_SUPPORT_FAILING_MEMORY_H

/* A program that failing_memory.cpp is linked into has a malloc that fails on demand, whoever calls it: the
 * library, libxml2, the operators `new`, the C library. Not for the sanitizers, which bring one of their own. */

namespace test {

/** Lets `room` more allocations succeed; after them one fails, or all do. */
void refuse_memory(long room, bool once = false);
/** Lets all succeed again, and sets errno to 0. Whether any failed. */
bool stop_refusing();
/** Begins to count the bytes that are handed out. */
void watch_memory();
/** The most bytes beyond those of the beginning that were in use at one time since then. */
long most_memory();

}  // namespace test

#endif
