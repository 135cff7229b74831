// Errors of the automation runtime: exceptions carrying number, source,
// description and line, as automation errors do.
#pragma once

#include <cstdint>
#include <exception>
#include <string>

namespace pelta {

// Error numbers the runtime itself raises (VB run-time numbers and HRESULTs).
namespace errc {
inline constexpr int32_t InvalidProcedureCall = 5;
inline constexpr int32_t Overflow = 6;
inline constexpr int32_t OutOfMemory = 7;
inline constexpr int32_t SubscriptOutOfRange = 9;
inline constexpr int32_t DivisionByZero = 11;
inline constexpr int32_t TypeMismatch = 13;
inline constexpr int32_t BadFileNameOrNumber = 52;
inline constexpr int32_t FileNotFound = 53;
inline constexpr int32_t PathNotFound = 76;
inline constexpr int32_t ObjectVariableNotSet = 91;
inline constexpr int32_t CannotCreateObject = 429;
inline constexpr int32_t ObjectRequired = 424;
inline constexpr int32_t NotSupported = 438;  // object doesn't support this property or method
inline constexpr int32_t WrongArgumentCount = 450;
inline constexpr int32_t ClassNotRegistered = static_cast<int32_t>(0x80040154);
inline constexpr int32_t ClassNotAvailable = static_cast<int32_t>(0x80040111);
inline constexpr int32_t Fail = static_cast<int32_t>(0x80004005);
inline constexpr int32_t InvalidData = static_cast<int32_t>(0x8007000D);
}  // namespace errc

class Error : public std::exception {
public:
    Error(int32_t number, std::string source, std::string description, int32_t line = 0);

    int32_t number() const noexcept { return number_; }
    const std::string& source() const noexcept { return source_; }
    const std::string& description() const noexcept { return description_; }
    int32_t line() const noexcept { return line_; }
    const char* what() const noexcept override { return description_.c_str(); }

    // The same error with `location` put in front of the source, separated by a
    // line break, so that the source reads outermost first. Number,
    // description and line stay as they were.
    Error withLocation(const std::string& location) const;

private:
    int32_t number_;
    std::string source_;
    std::string description_;
    int32_t line_;
};

[[noreturn]] void raise(int32_t number, std::string description, std::string source = {});

// The standard description of a runtime error number ("Type mismatch").
std::string describeError(int32_t number);

}  // namespace pelta
