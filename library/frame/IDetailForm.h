// What a list control needs of the detail form it opens.
#pragma once

#include <functional>
#include <string>

#include "library/contracts/Extenders.h"
#include "library/contracts/Framework.h"

namespace PeltaNom15 {

class IDetailForm : public virtual pelta::Object {
public:
    // Initialises the form for the client site; False when it cannot work.
    virtual bool frInit(IClientSite* Site) = 0;
    // Shows the record of `Key` (empty: a new record). False when refused.
    virtual bool ShowDetails(const std::string& Key) = 0;
    // The opener's list: told the refreshed list row after a save (null when
    // the save carried none), and told to refresh after a delete.
    virtual void SetOpener(std::function<void(RecordsetRef ListRow)> RowSaved,
                           std::function<void()> RecordDeleted) = 0;
    virtual IFormExtender* FormExtender() = 0;
};

}  // namespace PeltaNom15
