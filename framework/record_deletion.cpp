#include "framework/record_deletion.h"

#include "framework/form_extender.h"
#include "framework/services.h"
#include "platform/automation/ascii.h"
#include "platform/automation/error.h"
#include "platform/data/propertybag.h"
#include "platform/data/recordset.h"

namespace pelta::fw {

using namespace PeltaNom15;

namespace {

std::string textOf(const pelta::Variant& v) {
    if (v.isEmpty() || v.isNull() || v.isObject()) return {};
    return v.toString();
}

// Calls `operation` with `request`; the response bag, or null when the call failed.
pelta::Ref<pelta::PropertyBag> call(IBllConnection* connection, int32_t callKind,
                                    const std::string& operation,
                                    const pelta::PropertyBag& request) {
    pelta::Bytes response;
    pelta::ObjectRef context;
    bool ok = false;
    connection->Call(callKind, operation, request.contents(), response, 0, context, {}, ok);
    if (!ok) return nullptr;
    return pelta::PropertyBag::fromContents(response);
}

}  // namespace

// ---- RecordDeletion -----------------------------------------------------------------

bool RecordDeletion::DeleteRecords(IBllConnection* Connection, IGridExtender* Grid,
                                   IFormExtender* Form, int32_t CallKind,
                                   const std::string& Operation, const std::string& KeyField,
                                   bool OnlyInactive) {
    refusal_.reset();
    lastKeys_.clear();
    if (!Connection || !Grid) return false;
    auto rows = Grid->Rows();
    if (!rows) return false;

    auto marked = Grid->SelectedBookmarks();
    if (marked.empty() && Grid->HasCurrentRow()) marked.push_back(Grid->CurrentBookmark());

    auto reader = rows->clone();
    reader->clearFilter();
    bool hasActive = reader->fieldIndex("IsActive") >= 0;
    std::vector<std::string> keys;
    for (const auto& bookmark : marked) {
        try {
            reader->setBookmark(bookmark);
        } catch (const pelta::Error&) {
            continue;  // the row is gone
        }
        if (OnlyInactive) {
            if (!hasActive) continue;
            auto active = reader->value("IsActive");
            if (active.isNull() || active.isEmpty() || active.toBool()) continue;
        }
        auto key = textOf(reader->value(KeyField));
        if (!key.empty()) keys.push_back(std::move(key));
    }
    if (keys.empty()) return false;
    if (!send(Connection, CallKind, Operation, KeyField, keys)) return false;
    if (Form) Form->Refresh();
    return true;
}

bool RecordDeletion::DeleteRecord(IBllConnection* Connection, IFormExtender* Form, int32_t CallKind,
                                  const std::string& Operation, const std::string& KeyField,
                                  const std::string& Key) {
    refusal_.reset();
    lastKeys_.clear();
    if (!Connection || Key.empty()) return false;
    return send(Connection, CallKind, Operation, KeyField, {Key});
}

bool RecordDeletion::send(IBllConnection* connection, int32_t callKind,
                          const std::string& operation, const std::string& keyField,
                          const std::vector<std::string>& keys) {
    std::string joined;
    for (const auto& k : keys) {
        if (!joined.empty()) joined += kKeySeparator;
        joined += k;
    }
    lastKeys_ = keys;
    pelta::PropertyBag request;
    request.writeProperty(keyField, pelta::Variant(joined));
    auto response = call(connection, callKind, operation, request);
    if (!response) return false;
    auto error = response->readProperty("BllError");
    if (error.isEmpty() || error.isNull()) return true;
    DeletionRefusal r;
    r.code = error.isNumeric() ? error.toLong() : -1;
    r.table = textOf(response->readProperty("BllTable"));
    r.column = textOf(response->readProperty("BllColumn"));
    r.sqlError = textOf(response->readProperty("BllSqlError"));
    r.rowID = textOf(response->readProperty("BllRowID"));
    refusal_ = std::move(r);
    return false;
}

pelta::ObjectRef RecordDeletion::FindDetailForm(IFormExtender* ListForm) {
    if (!ListForm) return nullptr;
    auto detailClass = ListForm->DetailFormClass();
    if (detailClass.empty()) return nullptr;
    auto site = ListForm->ClientSite();
    for (auto* form : services()->threadForms()) {
        if (form == ListForm || form->closed() || !form->owner()) continue;
        if (!equalsNoCaseAscii(form->ObjectName(), detailClass)) continue;
        if (form->ClientSite().get() != site.get()) continue;
        return pelta::ObjectRef(form->owner());
    }
    return nullptr;
}

std::optional<DeletionRefusal> RecordDeletion::lastRefusal() const {
    return refusal_;
}

std::vector<std::string> RecordDeletion::lastKeys() const {
    return lastKeys_;
}

// ---- DetailOpener -------------------------------------------------------------------

void DetailOpener::Init(IClientSite* Site, const std::string& LayoutKey,
                        const std::string& ScreenName) {
    site_ = Site;
    layoutKey_ = LayoutKey;
    screenName_ = ScreenName;
    rights_.reset();
}

bool DetailOpener::HasRight(int32_t RightFlag) {
    if (!rights_) {
        if (!site_) return false;
        auto connection = site_->Connection();
        if (!connection) return false;
        pelta::PropertyBag request;
        request.writeProperty("Screen", pelta::Variant(screenName_));
        auto response = call(connection.get(), kBllCallKind, "GetUserRights", request);
        if (!response) return false;
        auto error = response->readProperty("BllError");
        if (!error.isEmpty() && !error.isNull()) return false;
        auto rights = response->readProperty("Rights");
        rights_ = rights.isNumeric() && !rights.isEmpty() ? rights.toLong() : 0;
    }
    return RightFlag != 0 && (*rights_ & RightFlag) == RightFlag;
}

}  // namespace pelta::fw
