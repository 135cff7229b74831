// The error module: handlers, the call stack in the source, the message
// shown, the log file with its name, header and entries, the debugger
// channel, the error hook and the instance register.
#include <gtest/gtest.h>

#include <regex>
#include <stdexcept>

#include "library/frame/mdErrorHandling.h"
#include "platform/automation/error.h"
#include "platform/automation/stackwalk.h"
#include "tests/library/frame_support.h"

using namespace PeltaNom15;
using frametest::lines;
using frametest::ScratchFolder;
namespace eh = PeltaNom15::mdErrorHandling;

namespace {

std::string loc(const std::string& object, const std::string& procedure) {
    return eh::FormatLocation(object, procedure);
}

void innermost() {
    try {
        pelta::raise(pelta::errc::DivisionByZero, {}, "origin");
    } catch (...) {
        RaiseError("pvInner", "modTest");
    }
}
void middle() {
    try {
        innermost();
    } catch (...) {
        RaiseError("pvMiddle", "modTest");
    }
}
void outermost() {
    try {
        middle();
    } catch (...) {
        RaiseError("pvOuter", "ctxRatios");
    }
}

TEST(ErrorHandling, ThreeNestedRaisesGiveThreeLocationsOutermostFirst) {
    ScratchFolder scratch(false);
    try {
        outermost();
        FAIL() << "no error reached the caller";
    } catch (const pelta::Error& e) {
        EXPECT_EQ(e.number(), pelta::errc::DivisionByZero);
        EXPECT_EQ(e.description(), "Division by zero");
        EXPECT_EQ(lines(e.source()),
                  (std::vector<std::string>{loc("ctxRatios", "pvOuter"), loc("modTest", "pvMiddle"),
                                            loc("modTest", "pvInner"), "origin"}));
    }
    // Every level logged the error on its way out.
    const std::string log = scratch.logText();
    size_t entries = 0;
    for (auto& l : lines(log))
        entries += l.rfind("= ", 0) == 0;
    EXPECT_EQ(entries, 3u);
}

TEST(ErrorHandling, LocationNamesComputerLibraryObjectProcedureAndLine) {
    const std::string pc = eh::ComputerName();
    EXPECT_EQ(eh::FormatLocation("cFormDispatcher", "IZonFormDispatcher_GetForm"),
              "[" + pc + "] PeltaNom15.cFormDispatcher.IZonFormDispatcher_GetForm");
    EXPECT_EQ(eh::FormatLocation("ctxRatios"), "[" + pc + "] PeltaNom15.ctxRatios");
    EXPECT_EQ(eh::FormatLocation("ctxRatios", "pvInit", 12),
              "[" + pc + "] PeltaNom15.ctxRatios.pvInit(12)");
    EXPECT_FALSE(eh::ComputerName(false).empty());
    EXPECT_EQ(pc.rfind(eh::ComputerName(false), 0), 0u);
}

TEST(ErrorHandling, PrintErrorLogsAndGoesOn) {
    ScratchFolder scratch(false);
    try {
        throw std::out_of_range("index 7");
    } catch (...) {
        EXPECT_EQ(PrintError("m_oForm_Fetch", "ctxRatios"), 0);
    }
    const std::string log = scratch.logText();
    EXPECT_NE(log.find("Error:\t\t&H9\n"), std::string::npos) << log;
    EXPECT_NE(log.find("Description:\tindex 7\n"), std::string::npos);
    EXPECT_NE(log.find("Call stack:\t" + loc("ctxRatios", "m_oForm_Fetch")), std::string::npos);
}

TEST(ErrorHandling, SavedErrorSurvivesCleanUpThatTrapsItsOwnErrors) {
    ScratchFolder scratch(false);
    try {
        try {
            pelta::raise(pelta::errc::TypeMismatch, {}, "first");
        } catch (...) {
            const ErrorInfo saved = eh::PushError();
            try {
                pelta::raise(pelta::errc::Overflow, {}, "clean-up");
            } catch (...) {
            }
            RaiseError("pvSave", "frmItemsDetails", &saved);
        }
    } catch (const pelta::Error& e) {
        EXPECT_EQ(e.number(), pelta::errc::TypeMismatch);
        EXPECT_EQ(lines(e.source()).back(), "first");
    }
}

TEST(ErrorHandling, ExceptionsMapToNumbers) {
    auto of = [](auto thrower) {
        try {
            thrower();
        } catch (...) {
            return eh::ErrorFromException(std::current_exception());
        }
        return ErrorInfo{};
    };
    EXPECT_EQ(of([] { throw pelta::Error(424, "src", "Object required", 3); }).Line, 3);
    EXPECT_EQ(of([] { throw std::bad_alloc(); }).Number, pelta::errc::OutOfMemory);
    EXPECT_EQ(of([] { throw std::invalid_argument("x"); }).Number,
              pelta::errc::InvalidProcedureCall);
    EXPECT_EQ(of([] { throw std::runtime_error("disk"); }).Description, "disk");
    // Anything else is marked unexpected.
    EXPECT_NE(of([] { throw 42; }).Description.find("Непредвидено изключение:"), std::string::npos);
}

TEST(ErrorHandling, ShownMessageOfAPeltaTextHasNoDetails) {
    ErrorInfo e{5, "src", "Pelta: Периодът е заключен.", 0};
    auto shown = eh::ComposeShownError(e, "[PC7] PeltaNom15.ctxLocks.pvSave");
    EXPECT_EQ(shown.Message, "Периодът е заключен.");
    EXPECT_TRUE(shown.Details.empty());

    ErrorInfo raw{static_cast<int32_t>(0x80004005), "inner", "Unspecified error", 0};
    shown = eh::ComposeShownError(raw, "[PC7] PeltaNom15.ctxLocks.pvSave");
    EXPECT_EQ(shown.Message, "Unspecified error");
    EXPECT_EQ(shown.Details, "Call stack:\n[PC7] PeltaNom15.ctxLocks.pvSave\ninner\n0x80004005");
}

TEST(ErrorHandling, ShowErrorWithoutFrameworkOnlyLogs) {
    ScratchFolder scratch(false);
    try {
        pelta::raise(pelta::errc::Fail, "Pelta: Няма връзка.");
    } catch (...) {
        EXPECT_EQ(ShowError("BeforeExecute", "ctxRatios", "Курсове"), 0);
    }
    EXPECT_EQ(scratch.logFiles().size(), 1u);
}

TEST(ErrorHandling, ShowErrorAsksTheFrameworkAndRestoresThePointer) {
    ScratchFolder scratch(false);
    frametest::HostInstall host;
    host->answers = {vbRetry};
    try {
        pelta::raise(pelta::errc::Fail, "Pelta: Няма връзка.");
    } catch (...) {
        EXPECT_EQ(ShowError("BeforeExecute", "ctxRatios", "Курсове"), vbRetry);
    }
    ASSERT_EQ(host->boxes.size(), 1u);
    EXPECT_EQ(host->boxes[0].Text, "Няма връзка.");
    EXPECT_EQ(host->boxes[0].Style, 18);
    EXPECT_EQ(host->boxes[0].Caption, "Курсове");
    EXPECT_EQ(host->boxes[0].Details, "");
    EXPECT_EQ(host->pointerHistory, (std::vector<int32_t>{0, 11}));
}

TEST(ErrorHandling, ErrorHookAnswerRetryMeansNeitherLogNorRaise) {
    ScratchFolder scratch(false);
    frametest::HostInstall host;
    host->hookAnswer = kErrorHookRetry;
    try {
        pelta::raise(5, {});
    } catch (...) {
        EXPECT_EQ(PrintError("pvA", "modTest"), kErrorHookRetry);
        EXPECT_EQ(RaiseError("pvB", "modTest"), kErrorHookRetry);  // did not raise
    }
    EXPECT_EQ(host->hooked,
              (std::vector<std::string>{loc("modTest", "pvA"), loc("modTest", "pvB")}));
    EXPECT_TRUE(scratch.logFiles().empty());
}

TEST(ErrorHandling, LogEntryLayoutAndHeaderReadBack) {
    ScratchFolder scratch(false);
    eh::LogError(0x1234, "First line\nsecond line", loc("ctxRatios", "pvInit"),
                 "inner\nfirst raise", "frame one\nframe two");
    const auto l = lines(scratch.logText());
    ASSERT_GE(l.size(), 13u);
    // Header of a new file.
    EXPECT_EQ(l[0].rfind("Logging started on ", 0), 0u);
    EXPECT_NE(l[1].find(" Build "), std::string::npos);
    EXPECT_NE(l[1].find('('), std::string::npos);
    EXPECT_NE(l[2].find(" GB"), std::string::npos);
    EXPECT_NE(l[2].find(", GUI "), std::string::npos);
    // The entry.
    EXPECT_EQ(l[3], "");
    EXPECT_TRUE(std::regex_match(
        l[4],
        std::regex(R"(= \d{4}\.\d{2}\.\d{2} \d{2}:\d{2}:\d{2}\.\d{3} \d+ 0x[0-9A-F]+ ={53})")))
        << l[4];
    EXPECT_EQ(l[5], "");
    EXPECT_EQ(l[6], "Error:\t\t&H1234");
    EXPECT_EQ(l[7], "Description:\tFirst line");
    EXPECT_EQ(l[8], "\t\tsecond line");
    EXPECT_EQ(l[9], "Call stack:\t" + loc("ctxRatios", "pvInit"));
    EXPECT_EQ(l[10], "\t\tinner");
    EXPECT_EQ(l[11], "\t\tfirst raise");
    EXPECT_EQ(l[12], "PDB call stack:\tframe one");
    EXPECT_EQ(l[13], "\t\tframe two");
}

TEST(ErrorHandling, NegativeNumbersAreWrittenAsUnsignedHex) {
    ScratchFolder scratch(false);
    eh::LogError(static_cast<int32_t>(0x80040154), "Class not registered", loc("m", "p"), {}, "-");
    EXPECT_NE(scratch.logText().find("Error:\t\t&H80040154\n"), std::string::npos);
}

TEST(ErrorHandling, TwoErrorsOnOneDayGoToOneFileEachWithItsSeparator) {
    ScratchFolder scratch(false);
    eh::LogError(5, "one", loc("m", "p"), {}, "-");
    eh::LogError(6, "two", loc("m", "p"), {}, "-");
    const auto l = lines(scratch.logText());
    std::vector<size_t> separators;
    size_t headers = 0;
    for (size_t i = 0; i < l.size(); ++i) {
        if (l[i].rfind("= ", 0) == 0) separators.push_back(i);
        headers += l[i].rfind("Logging started on ", 0) == 0;
    }
    ASSERT_EQ(separators.size(), 2u);
    EXPECT_EQ(headers, 1u);
    EXPECT_EQ(l[separators[0] + 2], "Error:\t\t&H5");
    EXPECT_EQ(l[separators[1] + 2], "Error:\t\t&H6");
    EXPECT_EQ(l[separators[1] - 1], "");
}

TEST(ErrorHandling, FileNameWithAndWithoutTheHostLogName) {
    const std::string pc = eh::ComputerName(false);
    std::regex plain("Errors_" + pc + R"(_\d{4}_\d{2}_\d{2}\.log)");
    EXPECT_TRUE(std::regex_match(eh::LogFileName(""), plain)) << eh::LogFileName("");
    std::regex named("Errors_" + pc + R"(_Trade_\d{4}_\d{2}_\d{2}\.log)");
    EXPECT_TRUE(std::regex_match(eh::LogFileName("Trade"), named)) << eh::LogFileName("Trade");
}

TEST(ErrorHandling, HostLogNameAndLoggerAreUsed) {
    ScratchFolder scratch(false);
    frametest::HostInstall host;
    host->logName = "Shell";
    host->offerLogger = true;
    eh::LogError(5, "through the host", loc("m", "p"), {}, " ");  // blank: no native stack
    EXPECT_NE(host->openedFile.find("_Shell_"), std::string::npos) << host->openedFile;
    ASSERT_GE(host->printed.size(), 7u);
    EXPECT_EQ(host->printed[0].rfind("Logging started on ", 0), 0u);
    EXPECT_EQ(host->printed.back(), "Call stack:\t" + loc("m", "p"));
    EXPECT_TRUE(scratch.logFiles().empty());
}

TEST(ErrorHandling, UnexpectedErrorsBypassTheHostLogger) {
    ScratchFolder scratch(false);
    frametest::HostInstall host;
    host->offerLogger = true;
    eh::LogError(5, "Непредвидено изключение: access violation", loc("m", "p"), {}, "-");
    EXPECT_TRUE(host->printed.empty());
    EXPECT_EQ(scratch.logFiles().size(), 1u);
}

TEST(ErrorHandling, AnErrorLoggedBeforeIsNotWrittenAgain) {
    ScratchFolder scratch(true);
    eh::LogError(5, "Some failure\nPelta:\n", loc("m", "p"), {}, "-");
    EXPECT_TRUE(scratch.logFiles().empty());
    EXPECT_NE(scratch.debugText().find(": Error: Some failure"), std::string::npos);
}

TEST(ErrorHandling, NativeStackIsAddedWhenTheStackWalkIsRegistered) {
    ScratchFolder scratch(false);
    pelta::registerStackWalk();
    eh::LogError(5, "with stack", loc("m", "p"), {});
    pelta::unregisterStackWalk();
    eh::LogError(6, "without stack", loc("m", "p"), {});
    const std::string log = scratch.logText();
    const size_t second = log.find("without stack");
    const size_t pdb = log.find("PDB call stack:\t");
    ASSERT_NE(pdb, std::string::npos);
    EXPECT_LT(pdb, second);
    EXPECT_EQ(log.find("PDB call stack:", second), std::string::npos);
}

TEST(ErrorHandling, StackWalkNamesTheCallers) {
    const std::string stack = pelta::nativeCallStack();
    EXPECT_FALSE(stack.empty());
    EXPECT_NE(stack.find('\n'), std::string::npos);
}

TEST(DebugOutput, OffWhenTheSwitchIsUnsetOrZero) {
    ScratchFolder scratch(false);
    EXPECT_FALSE(eh::DebugEnabled());
    eh::DebugOutput("invisible\n");
    eh::LogError(5, "quiet", loc("m", "p"), {}, "-");
    ::setenv("_ZON_PELTA_DEBUG", "0", 1);
    eh::ReloadDebugSwitch();
    EXPECT_FALSE(eh::DebugEnabled());
    eh::DebugOutput("still invisible\n");
    EXPECT_EQ(scratch.debugText(), "");
}

TEST(DebugOutput, OnWithANonZeroNumber) {
    ScratchFolder scratch(true);
    EXPECT_TRUE(eh::DebugEnabled());
    eh::DebugOutput("visible\n");
    eh::LogError(5, "loud", loc("ctxRatios", "pvInit"), {}, "-");
    const auto l = lines(scratch.debugText());
    ASSERT_EQ(l.size(), 2u);
    EXPECT_EQ(l[0], "visible");
    EXPECT_TRUE(std::regex_match(l[1], std::regex(R"(\d+ \d+\.\d{3}: Error: loud \[.*\])")))
        << l[1];
    EXPECT_TRUE(l[1].ends_with("[" + loc("ctxRatios", "pvInit") + "]"));
    ::setenv("_ZON_PELTA_DEBUG", "abc", 1);
    eh::ReloadDebugSwitch();
    EXPECT_FALSE(eh::DebugEnabled());
}

TEST(DebugOutput, DiagnosticLinesGoOnlyToTheDebugger) {
    ScratchFolder scratch(true);
    eh::LogError(0, "Using Forms.Add for PeltaNom15.frmX", loc("cFormDispatcher", "GetForm"), {});
    EXPECT_TRUE(scratch.logFiles().empty());
    EXPECT_NE(scratch.debugText().find("Using Forms.Add for PeltaNom15.frmX"), std::string::npos);
}

TEST(InstanceRegister, LocalRegisterCountsAndWarnsAboutMisuse) {
    ScratchFolder scratch(true);
    const int32_t before = eh::LocalInstanceCount();
    int32_t id = 0;
    int dummy = 0;
    eh::DebugInstanceInit("ctxTest", id, &dummy);
    EXPECT_NE(id, 0);
    EXPECT_EQ(eh::LocalInstanceCount(), before + 1);
    eh::DebugInstanceInit("ctxTest", id, &dummy);  // registered twice
    EXPECT_NE(scratch.debugText().find("Init (This should not happen)"), std::string::npos);
    EXPECT_EQ(eh::LocalInstanceCount(), before + 1);
    eh::DebugInstanceTerm("ctxTest", id);
    EXPECT_EQ(id, 0);
    EXPECT_EQ(eh::LocalInstanceCount(), before);
}

TEST(InstanceRegister, EmptyConsoleOnTermIsReported) {
    ScratchFolder scratch(true);
    frametest::HostInstall host;
    host->offerConsole = true;
    int32_t id = 7;
    eh::DebugInstanceTerm("ctxTest", id);
    EXPECT_NE(scratch.debugText().find("DebugIDs collection is empty"), std::string::npos);
}

TEST(LogFolder, FallsBackToTheTemporaryFolderOrTheLibraryFolder) {
    ::unsetenv("PELTA_LOG_FOLDER");
    const std::string folder = eh::LogFolder();
    EXPECT_TRUE(folder.ends_with("Logs")) << folder;
    EXPECT_TRUE(std::filesystem::is_directory(folder));
}

}  // namespace
