// Helpers of this library: its name and the name table of the entry object.
#pragma once

#include <string>

#include "platform/automation/object.h"

namespace PeltaNom15 {

inline constexpr const char* kLibName = "PeltaNom15";

// The name table of cFormDispatcher.GetForm: a new instance of the report
// class, report layout or form of that name (compared without regard to
// case), or nothing for a name not in the table. Raises CannotCreateObject
// for a name of the table whose class is not available.
pelta::ObjectRef FormDispatcherGetForm(const std::string& Name);

}  // namespace PeltaNom15
