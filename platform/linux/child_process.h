// Starting the platform as a child, and the moment in which the child becomes it.
#ifndef PLATFORM_LINUX_CHILD_PROCESS_H
#define PLATFORM_LINUX_CHILD_PROCESS_H

enum ChildOutcome {
    CHILD_STARTED,    // in the parent: the child has been executed, or could not be and will end
    CHILD_NOT_FORKED, // in the parent: there is no child
    IN_FAILED_CHILD   // in the child, which is still the launcher: args[0] could not be executed
};

struct ChildStart {
    ChildOutcome outcome;
    int pid;        // of the child, in the parent; 0 otherwise
    int execResult; // of execv, in the child; 0 otherwise
};

/// Starts a child that executes args[0] with `args`, which ends with a null. The parent returns
/// only once the child has become the new program or has failed to. Error lines, always written:
/// the child that cannot be executed writes "Unable to execute <path> : <reason>", a launcher that
/// cannot fork writes "Unable to start <path> : <reason>".
ChildStart startChild(char** args);

/// Waits until the child has ended; its status is not looked at. False when waiting failed.
bool waitForChild(int pid);

/// Makes the end of children visible to this process, whatever it inherited.
void watchChildren();

#endif
