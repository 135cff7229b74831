#include "platform/automation/error.h"

#include <utility>

namespace pelta {

Error::Error(int32_t number, std::string source, std::string description, int32_t line)
    : number_(number),
      source_(std::move(source)),
      description_(std::move(description)),
      line_(line) {}

Error Error::withLocation(const std::string& location) const {
    std::string source = source_.empty() ? location : location + "\n" + source_;
    return Error(number_, std::move(source), description_, line_);
}

void raise(int32_t number, std::string description, std::string source) {
    if (description.empty()) description = describeError(number);
    throw Error(number, std::move(source), std::move(description));
}

std::string describeError(int32_t number) {
    switch (number) {
        case errc::InvalidProcedureCall:
            return "Invalid procedure call or argument";
        case errc::Overflow:
            return "Overflow";
        case errc::OutOfMemory:
            return "Out of memory";
        case errc::SubscriptOutOfRange:
            return "Subscript out of range";
        case errc::DivisionByZero:
            return "Division by zero";
        case errc::TypeMismatch:
            return "Type mismatch";
        case errc::BadFileNameOrNumber:
            return "Bad file name or number";
        case errc::FileNotFound:
            return "File not found";
        case errc::PathNotFound:
            return "Path not found";
        case errc::ObjectVariableNotSet:
            return "Object variable or With block variable not set";
        case errc::CannotCreateObject:
            return "ActiveX component can't create object";
        case errc::ObjectRequired:
            return "Object required";
        case errc::NotSupported:
            return "Object doesn't support this property or method";
        case errc::WrongArgumentCount:
            return "Wrong number of arguments or invalid property assignment";
        case errc::ClassNotRegistered:
            return "Class not registered";
        case errc::ClassNotAvailable:
            return "Class not available";
        case errc::InvalidData:
            return "The data is invalid";
        default:
            return "Automation error";
    }
}

}  // namespace pelta
