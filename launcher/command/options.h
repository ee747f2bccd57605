// The launcher's options: whole words of the command line, compared exactly. The first occurrence
// of a word counts, behind "-vmargs" too; the program path never does.
#ifndef LAUNCHER_COMMAND_OPTIONS_H
#define LAUNCHER_COMMAND_OPTIONS_H

bool isRestart(int argc, wchar_t** argv);       // "-restart"
bool isDCommandOnly(int argc, wchar_t** argv);  // "-dcommand_only": known, without an effect
bool isInitMUService(int argc, wchar_t** argv); // "-initMUService": known, without an effect
bool isResetConfig(int argc, wchar_t** argv);   // "-resetconfig"
bool isVmOverride(int argc, wchar_t** argv);    // "-vm"

/// "-debug", and not "-restart".
bool isDebug(int argc, wchar_t** argv);

/// "-velmoraWait" and "-provManifest": an installer asks for provisioning.
bool isISMPProvisioning(int argc, wchar_t** argv);

/// Ends the process with a line QVMRL0031I that names the version when "-version" is the only
/// word behind the program path.
void doVersionCheck(int argc, wchar_t** argv);

/// Ends a start whose words are not as many as "-maxargcnt" declares ("-restart" not counted): a
/// link may have brought some in. "QVMRL0069E: velmora invoked with an invalid URL handler action
/// - bad argument count."
void validateIfUrlHandlerLaunch(int argc, wchar_t** argv);

/// Ends a start with a double quote in any word, the program path included. "QVMRL0089E: velmora
/// invoked with double quote in arg - bad argument."
void validateThatDoubleQuotesNotUsed(int argc, wchar_t** argv);

/// Ends a start with "jvm.library.path" (QVMRL0190E), "java.library.path" (QVMRL0191E) or
/// "java.home" (QVMRL0192E) anywhere in a word, the program path included.
void validateNoJavaLibraryPath(int argc, wchar_t** argv);

#endif
