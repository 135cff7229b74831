// The stack-walk component: the native call stack of the calling thread as
// text, offered to libraries as the late-bound object "ZonStackWalk.Symbols"
// with the method GetCallStack. A host registers it in its own process; a
// library creates it by name and works on without it when it is absent.
#pragma once

#include <string>

namespace pelta {

inline constexpr const char* kProgIdStackWalk = "ZonStackWalk.Symbols";

// One frame a line, innermost first, without the frames of the walk itself;
// function names demangled where the symbol table has them.
std::string nativeCallStack(int skipFrames = 0);

// Registers "ZonStackWalk.Symbols" as a local class of this process.
void registerStackWalk();
void unregisterStackWalk();

}  // namespace pelta
