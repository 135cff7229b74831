// The shared record-deletion service and the per-list detail opener.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "library/contracts/Extenders.h"
#include "library/contracts/Framework.h"

namespace pelta::fw {

// The separator of several keys in one value.
inline constexpr const char* kKeySeparator = "\x01";

// A refusal the service answered to the last deletion ("BllError" and the
// texts that came with it).
struct DeletionRefusal {
    int32_t code = 0;
    std::string table;
    std::string column;
    std::string sqlError;
    std::string rowID;
};

// Deletes records through a delete operation: the request property named by
// the key field holds the keys joined by U+0001. A failed call or a
// "BllError" in the answer counts as failure. After a deletion the list's
// form extender fetches and fills again, so the list shows what is left.
class RecordDeletion : public PeltaNom15::IRecordDeletion {
public:
    bool DeleteRecords(PeltaNom15::IBllConnection* Connection, PeltaNom15::IGridExtender* Grid,
                       PeltaNom15::IFormExtender* Form, int32_t CallKind,
                       const std::string& Operation, const std::string& KeyField,
                       bool OnlyInactive) override;
    bool DeleteRecord(PeltaNom15::IBllConnection* Connection, PeltaNom15::IFormExtender* Form,
                      int32_t CallKind, const std::string& Operation, const std::string& KeyField,
                      const std::string& Key) override;
    // The owner of a live, open form extender whose object name is the list's
    // detail form class and whose client site is the list's.
    pelta::ObjectRef FindDetailForm(PeltaNom15::IFormExtender* ListForm) override;

    // The refusal of the last deletion, if it was refused by the service.
    std::optional<DeletionRefusal> lastRefusal() const;
    // The keys sent by the last deletion (empty when nothing was sent).
    std::vector<std::string> lastKeys() const;

private:
    bool send(PeltaNom15::IBllConnection* connection, int32_t callKind,
              const std::string& operation, const std::string& keyField,
              const std::vector<std::string>& keys);

    std::optional<DeletionRefusal> refusal_;
    std::vector<std::string> lastKeys_;
};

// Rights of the current user on a list's screen, asked of the service with
// the operation "GetUserRights" (request "Screen", response "Rights", a long
// of flags). Asked once, on the first HasRight; a failed call grants nothing
// and is asked again next time.
class DetailOpener : public PeltaNom15::IDetailOpener {
public:
    void Init(PeltaNom15::IClientSite* Site, const std::string& LayoutKey,
              const std::string& ScreenName) override;
    bool HasRight(int32_t RightFlag) override;

    const std::string& layoutKey() const noexcept { return layoutKey_; }
    const std::string& screenName() const noexcept { return screenName_; }

private:
    pelta::Ref<PeltaNom15::IClientSite> site_;
    std::string layoutKey_;
    std::string screenName_;
    std::optional<int32_t> rights_;
};

}  // namespace pelta::fw
