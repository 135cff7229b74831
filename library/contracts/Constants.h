// Command numbers, right flags, message-box styles and buttons shared with the
// framework.
#pragma once

#include <cstdint>

namespace PeltaNom15 {

// Framework commands.
inline constexpr int32_t kCmdNew = 101;
inline constexpr int32_t kCmdOpen = 102;
inline constexpr int32_t kCmdCopyRecord = 103;
inline constexpr int32_t kCmdDelete = 118;  // delete in a detail form
inline constexpr int32_t kCmdSave = 201;
inline constexpr int32_t kCmdSaveAs = 202;
inline constexpr int32_t kCmdPrint = 204;
inline constexpr int32_t kCmdDeleteInactive = 205;
inline constexpr int32_t kCmdRefresh = 207;
inline constexpr int32_t kCmdExport = 304;
inline constexpr int32_t kCmdCopy = 318;
inline constexpr int32_t kCmdProperties = 502;
inline constexpr int32_t kCmdFilter = 506;

// Right flags asked of the detail opener.
inline constexpr int32_t kRightOpenDetails = 4;
inline constexpr int32_t kRightCreate = 8;
inline constexpr int32_t kRightEdit = 16;
inline constexpr int32_t kRightDelete = 32;

// Message-box styles (combinable).
inline constexpr int32_t vbOKOnly = 0;
inline constexpr int32_t vbOKCancel = 1;
inline constexpr int32_t vbAbortRetryIgnore = 2;
inline constexpr int32_t vbYesNoCancel = 3;
inline constexpr int32_t vbYesNo = 4;
inline constexpr int32_t vbRetryCancel = 5;
inline constexpr int32_t vbCritical = 16;
inline constexpr int32_t vbQuestion = 32;
inline constexpr int32_t vbExclamation = 48;
inline constexpr int32_t vbInformation = 64;

// Buttons a message box answers with.
inline constexpr int32_t vbOK = 1;
inline constexpr int32_t vbCancel = 2;
inline constexpr int32_t vbAbort = 3;
inline constexpr int32_t vbRetry = 4;
inline constexpr int32_t vbIgnore = 5;
inline constexpr int32_t vbYes = 6;
inline constexpr int32_t vbNo = 7;

// The host error hook's answer that means: handled, neither log nor raise.
inline constexpr int32_t kErrorHookRetry = 4;

}  // namespace PeltaNom15
