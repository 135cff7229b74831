// The entry object's interface: every non-public screen by name.
#pragma once

#include <string>

#include "platform/automation/object.h"

namespace PeltaNom15 {

class IZonFormDispatcher : public virtual pelta::Object {
public:
    virtual std::string LibName() = 0;
    // A new instance for `Name`, or nothing.
    virtual pelta::ObjectRef GetForm(std::string& Name) = 0;
    // Unloads every loaded form; returns the number still loaded.
    virtual int32_t UnloadAllForms() = 0;
};

}  // namespace PeltaNom15
