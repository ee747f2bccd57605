// The words of a command line, and the search for one.
#ifndef PLATFORM_LINUX_ARGUMENT_VECTOR_H
#define PLATFORM_LINUX_ARGUMENT_VECTOR_H

#include <vector>

/// Words that somebody else owns: the process arguments, or a property list. The list must be
/// released after the vector.
typedef std::vector<wchar_t*> ArgumentVector;

/// The words of `argv` as wide text, `argc` of them, without a terminating null. They live until
/// the process ends. Fatal: QVMRL0004E, out of memory.
ArgumentVector wideArguments(int argc, char** argv);

/// The index of the first word of argv[1] to argv[argc - 1] that equals `option` exactly, else
/// -1. The program path is never looked at; words behind "-vmargs" are.
int findOption(const wchar_t* option, int argc, wchar_t** argv);

/// True when one of the first `count` words equals `option` exactly; args[0] counts.
bool haveLaunchOption(const char* option, char** args, int count);

#endif
