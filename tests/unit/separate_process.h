// Tests in a process of their own: forked, as an ordinary user, in private namespaces, or with a
// system call that fails.
//
// Expectations inside the action count: a process in which one failed prints it and ends with
// another status. The action of a private world sees an empty /tmp that nobody else sees, and
// whatever it mounts and writes there is gone with it.
#ifndef TESTS_UNIT_SEPARATE_PROCESS_H
#define TESTS_UNIT_SEPARATE_PROCESS_H

#include <gtest/gtest.h>

#include <cstddef>
#include <functional>
#include <string>
#include <sys/types.h>

/// Forks; the child runs `action` and ends by _exit: 0, or 1 when an expectation failed.
pid_t startProcess(const std::function<void()>& action);

/// Waits for a child. Its exit status, or 1000 + the signal that ended it.
int statusOf(pid_t child);

/// The exit status of `action` in a process of its own, as statusOf.
int statusOf(const std::function<void()>& action);

/// True when `action` returned and none of its expectations failed.
testing::AssertionResult holdsInChild(const std::function<void()>& action);

/// The same as an ordinary user: what root starts becomes the user 65534, for good.
testing::AssertionResult holdsAsOrdinaryUser(const std::function<void()>& action);

/// Gives a directory and all it holds to the user that holdsAsOrdinaryUser will be.
void giveToOrdinaryUser(const std::string& dir);

/// The same in a mount namespace with an empty /tmp.
testing::AssertionResult holdsInPrivateTmp(const std::function<void()>& action);

/// The same with process numbers that begin anew besides: `action` is process 1, and /proc shows
/// just that and what it starts.
testing::AssertionResult holdsInPrivateProc(const std::function<void()>& action);

/// Why this machine cannot do so: empty where it can.
std::string noPrivateTmp();
std::string noPrivateProc();

#define NEEDS_PRIVATE_TMP()                                                                        \
    if (!noPrivateTmp().empty())                                                                   \
    GTEST_SKIP() << noPrivateTmp()
#define NEEDS_PRIVATE_PROC()                                                                       \
    if (!noPrivateProc().empty())                                                                  \
    GTEST_SKIP() << noPrivateProc()

/// From now on this system call of the process fails with `reason`. False where that cannot be had.
bool makeFail(long systemCall, int reason);

/// Waits until the process sleeps in a system call. False when it ended instead.
bool waitUntilAsleep(pid_t child);

/// Waits until a process that sleeps has woken up and sleeps again. False when it ended instead.
bool waitUntilAsleepAgain(pid_t child);

/// From now on the process may take `more` bytes of memory beyond what it has. Without effect under
/// the address sanitizer.
void boundMemory(size_t more);

/// True in a build with the address sanitizer, whose memory no limit can bound.
bool underAddressSanitizer();

/// The bytes of a file; empty when there is none.
std::string bytesOf(const std::string& path);

#endif
