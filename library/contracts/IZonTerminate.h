// The termination protocol every screen and the entry object follow.
#pragma once

#include "platform/automation/object.h"

namespace PeltaNom15 {

class IZonTerminate : public virtual pelta::Object {
public:
    // Sets `Cancel` to refuse termination. Called again with `Cancel` True
    // when termination was abandoned after this object had agreed.
    virtual void QueryTerminate(bool& Cancel) = 0;
    // Releases every reference the object holds.
    virtual void Terminate() = 0;
};

}  // namespace PeltaNom15
