// One way for the whole library to trap, trace, log and show run-time errors,
// and the developer's diagnostics: the debugger channel, the register of live
// instances and the error log file.
//
// The current error is the exception being handled. A handler traps every
// error and hands it on with its own location:
//
//   void ctxRatios::pvInit() {
//       try {
//           ...
//       } catch (...) {
//           RaiseError("pvInit", "ctxRatios");   // or PrintError / ShowError
//       }
//   }
//
// A handler that must clean up first saves the error, because the clean-up
// may trap errors of its own:
//
//   } catch (...) {
//       const ErrorInfo oErr = mdErrorHandling::PushError();
//       pvCleanUp();
//       RaiseError("pvSave", "frmItemsDetails", &oErr);
//   }
//
// RaiseError puts the location in front of the error's source, so the source
// of an error that went through several procedures lists their locations
// outermost first. Nothing in this module raises while logging.
#pragma once

#include <cstdint>
#include <exception>
#include <string>

#include "library/contracts/Framework.h"

namespace PeltaNom15 {

// A saved error: number, source, description, line.
struct ErrorInfo {
    int32_t Number = 0;
    std::string Source;
    std::string Description;
    int32_t Line = 0;
};

namespace mdErrorHandling {

// The error an exception stands for: a pelta::Error as it is; a standard
// exception mapped to the nearest runtime number with its message; anything
// else as an unexpected exception.
ErrorInfo ErrorFromException(std::exception_ptr Exception);

// Saves the current error (the exception being handled; else the error saved
// last) and returns a copy. Called first in a handler.
ErrorInfo PushError();
// Makes the saved (or the given) error the current saved error again.
void PopError();
void PopError(const ErrorInfo& Error);
// The error saved last.
const ErrorInfo& SavedError();

// Each takes the given error, else the exception being handled, else the
// error saved last.
// Logs the error and goes on.
void PrintError(const std::string& Procedure, const std::string& Object,
                const ErrorInfo* Error = nullptr);
// Logs the error and raises it again with the location in front of its source.
[[noreturn]] void RaiseError(const std::string& Procedure, const std::string& Object,
                             const ErrorInfo* Error = nullptr);
// Logs the error and shows it (style 18) with `Caption`; returns the button,
// or 0 when no message box can be shown (no framework).
int32_t ShowError(const std::string& Procedure, const std::string& Object,
                  const std::string& Caption, const ErrorInfo* Error = nullptr);

// What ShowError puts into the message box: a description "Pelta: text"
// gives "text" without details; any other gives the description with the
// call stack and the number as details.
struct ShownError {
    std::string Message;
    std::string Details;
};
ShownError ComposeShownError(const ErrorInfo& Error, const std::string& Location);

// Offers the error to the host application's error hook; its answer, or 0
// when there is no host.
int32_t OfferErrorHook(const ErrorInfo& Error, const std::string& Location);

// Writes the debugger line and the error log entry. Number 0 is a diagnostic
// line: it goes to the debugger output only.
void LogError(int32_t Number, const std::string& Description, const std::string& Location,
              const std::string& Source, const std::string& StackText = {},
              bool Unexpected = false);

// "[" computer "] PeltaNom15." object ["." procedure] ["(" line ")"].
std::string FormatLocation(const std::string& Object, const std::string& Procedure = {},
                           int32_t Line = 0);

// The computer's host name (at most 255 characters). In a remote login
// session (SSH_CONNECTION or SSH_CLIENT set) the name used in locations is
// followed by ":" and the login session number (XDG_SESSION_ID, else the
// process's session id).
std::string ComputerName(bool WithSession = true);

// ---- debugger channel ------------------------------------------------------
// The switch is the environment variable "_ZON_PELTA_DEBUG" (any non-zero
// number turns output on), read once per process. Output goes to the standard
// error stream, or appended to the file named by PELTA_DEBUG_OUTPUT.
bool DebugEnabled();
// Reads the switch again (for hosts and tests that change the environment).
void ReloadDebugSwitch();
void DebugOutput(const std::string& Text);

// ---- instance register -----------------------------------------------------
// Enters an object under its class name; `ID` receives its identifier (an
// object whose ID is already set is being registered twice). Kept by the
// host's debug console when there is one, else by the library.
void DebugInstanceInit(const std::string& ClassName, int32_t& ID, const void* Address = nullptr);
void DebugInstanceTerm(const std::string& ClassName, int32_t& ID);
// Number of entries in the library's own register (without a debug console).
int32_t LocalInstanceCount();

// ---- error log file --------------------------------------------------------
// A log file open for appending, locally or through the host's logger.
struct LogFileHandle {
    pelta::Ref<IHostLogger> Logger;
    void* File = nullptr;  // FILE*
    explicit operator bool() const noexcept { return Logger || File; }
};
// Opens (appends) `FileName`, through the host's logger unless `Unexpected`
// or there is none. A new file gets the header first.
LogFileHandle LogFileOpen(const std::string& FileName, bool Unexpected = false);
void LogFilePrint(LogFileHandle& File, const std::string& Text);
int64_t LogFileLOF(LogFileHandle& File);
void LogFileClose(LogFileHandle& File);

// The folder of the error logs: PELTA_LOG_FOLDER when set, else the library
// folder's "../Logs", "../../Logs", "Logs" under the library folder (created),
// else "PeltaLogs" under the temporary folder (created).
std::string LogFolder();
// "Errors_" computer ["_" host log name] "_" yyyy_MM_dd ".log".
std::string LogFileName(const std::string& HostLogName);

}  // namespace mdErrorHandling

// The object-level handlers a screen calls: the error is first offered to the
// host's error hook, whose answer they return; when it is kErrorHookRetry they
// neither log nor raise.
int32_t PrintError(const std::string& Procedure, const std::string& Object,
                   const ErrorInfo* Error = nullptr);
int32_t RaiseError(const std::string& Procedure, const std::string& Object,
                   const ErrorInfo* Error = nullptr);
int32_t ShowError(const std::string& Procedure, const std::string& Object,
                  const std::string& Caption, const ErrorInfo* Error = nullptr);

}  // namespace PeltaNom15
