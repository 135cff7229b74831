#include "platform/automation/stackwalk.h"

#include <cxxabi.h>
#include <execinfo.h>

#include <cstdlib>
#include <memory>

#include "platform/automation/registry.h"
#include "platform/automation/variant.h"

namespace pelta {

namespace {

constexpr int kMaxFrames = 64;

// "module(mangled+0x1f) [0x...]" with the name demangled when it can be.
std::string demangleFrame(const char* frame) {
    std::string s(frame);
    const size_t open = s.find('(');
    const size_t plus = s.find('+', open == std::string::npos ? 0 : open);
    if (open == std::string::npos || plus == std::string::npos || plus <= open + 1) return s;
    const std::string mangled = s.substr(open + 1, plus - open - 1);
    int status = 0;
    std::unique_ptr<char, void (*)(void*)> name(
        abi::__cxa_demangle(mangled.c_str(), nullptr, nullptr, &status), std::free);
    if (status != 0 || !name) return s;
    return s.substr(0, open + 1) + name.get() + s.substr(plus);
}

class StackWalkSymbols final : public Object {
public:
    Variant invoke(std::string_view member, CallKind kind, std::span<Variant> args) override {
        // The frames of this call and of the late-bound dispatch are left out.
        if (memberIs(member, "GetCallStack")) return nativeCallStack(2);
        return Object::invoke(member, kind, args);
    }
    std::string typeName() const override { return "Symbols"; }
};

}  // namespace

std::string nativeCallStack(int skipFrames) {
    void* frames[kMaxFrames];
    const int n = backtrace(frames, kMaxFrames);
    std::unique_ptr<char*, void (*)(void*)> symbols(backtrace_symbols(frames, n), std::free);
    std::string r;
    if (!symbols) return r;
    for (int i = 1 + (skipFrames > 0 ? skipFrames : 0); i < n; ++i) {
        if (!r.empty()) r += '\n';
        r += demangleFrame(symbols.get()[i]);
    }
    return r;
}

void registerStackWalk() {
    registerLocalClass(kProgIdStackWalk, [] { return ObjectRef(makeRef<StackWalkSymbols>()); });
}

void unregisterStackWalk() {
    unregisterLocalClass(kProgIdStackWalk);
}

}  // namespace pelta
