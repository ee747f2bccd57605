// The words of an initial configuration run.
#ifndef LAUNCHER_COMMAND_INITIAL_RUN_H
#define LAUNCHER_COMMAND_INITIAL_RUN_H

#include "platform/linux/argument_vector.h"

/// The program path, "-config" and "initial", and of the words of `argv` the first that begins
/// like "-data", with the word behind it, and the first that begins like each of "-debug",
/// "-console" and "-noExit". Everything else is dropped. The words stay with argv.
ArgumentVector initialRunWords(int argc, wchar_t** argv);

#endif
