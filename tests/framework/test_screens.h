// A currency-rates list and its detail form written the way the library
// writes its screens: they own their extenders, made by programmatic
// identifier, and answer the framework's events. The framework tests drive
// them as a host would.
#pragma once

#include <string>
#include <vector>

#include "framework/framework.h"
#include "framework/services.h"
#include "library/contracts/Constants.h"
#include "library/contracts/Extenders.h"
#include "platform/automation/error.h"
#include "platform/automation/registry.h"
#include "prepared_connection.h"

namespace fwtest {

using namespace PeltaNom15;

inline constexpr const char* kRateBnb1 = "{11111111-0000-0000-0000-000000000001}";
inline constexpr const char* kRateBnb2 = "{11111111-0000-0000-0000-000000000002}";
inline constexpr const char* kRateUcb = "{11111111-0000-0000-0000-000000000003}";
inline constexpr const char* kBankBnb = "{22222222-0000-0000-0000-000000000001}";
inline constexpr const char* kCurrUsd = "{33333333-0000-0000-0000-000000000001}";
inline constexpr const char* kCurrEur = "{33333333-0000-0000-0000-000000000002}";

// The list: ID, Date, PrName (the bank), IsActive. The second BNB rate and
// the UniCredit rate are inactive.
inline RecordsetRef ratesList() {
    auto rs = pelta::makeRef<pelta::Recordset>();
    rs->appendField("ID", pelta::FieldType::Guid);
    rs->appendField("Date", pelta::FieldType::Date);
    rs->appendField("PrName", pelta::FieldType::Text, 100);
    rs->appendField("IsActive", pelta::FieldType::Boolean);
    rs->open();
    auto add = [&](const char* id, int day, const char* bank, bool active) {
        rs->addNew();
        rs->setValue("ID", pelta::Variant(id));
        rs->setValue("Date", pelta::Variant(pelta::makeDate(2024, 3, day)));
        rs->setValue("PrName", pelta::Variant(bank));
        rs->setValue("IsActive", pelta::Variant(active));
        rs->update();
    };
    add(kRateBnb1, 1, "БНБ", true);
    add(kRateBnb2, 2, "БНБ", false);
    add(kRateUcb, 3, "УниКредит", false);
    rs->updateBatch();
    return rs;
}

inline RecordsetRef rateHead(const std::string& id) {
    auto rs = pelta::makeRef<pelta::Recordset>();
    rs->appendField("ID", pelta::FieldType::Guid);
    rs->appendField("Date", pelta::FieldType::Date);
    rs->appendField("IsActive", pelta::FieldType::Boolean);
    rs->appendField("Pr_ID", pelta::FieldType::Guid);
    rs->appendField("Note", pelta::FieldType::LongText);
    rs->appendField("LU", pelta::FieldType::Text, 100);
    rs->open();
    if (!id.empty()) {
        rs->addNew();
        rs->setValue("ID", pelta::Variant(id));
        rs->setValue("Date", pelta::Variant(pelta::makeDate(2024, 3, 1)));
        rs->setValue("IsActive", pelta::Variant(true));
        rs->setValue("Pr_ID", pelta::Variant(kBankBnb));
        rs->setValue("Note", pelta::Variant("начален"));
        rs->update();
        rs->updateBatch();
    }
    return rs;
}

inline RecordsetRef rateRows(const std::string& id) {
    auto rs = pelta::makeRef<pelta::Recordset>();
    rs->appendField("CurrRatio_ID", pelta::FieldType::Guid);
    rs->appendField("Currency_ID", pelta::FieldType::Guid);
    rs->appendField("Units", pelta::FieldType::Long);
    rs->appendField("Ratio", pelta::FieldType::Double);
    rs->open();
    if (!id.empty()) {
        for (auto* currency : {kCurrUsd, kCurrEur}) {
            rs->addNew();
            rs->setValue("CurrRatio_ID", pelta::Variant(id));
            rs->setValue("Currency_ID", pelta::Variant(currency));
            rs->setValue("Units", pelta::Variant(1));
            rs->setValue("Ratio", pelta::Variant(currency == kCurrUsd ? 1.8 : 1.95583));
            rs->update();
        }
        rs->updateBatch();
    }
    return rs;
}

// Answers of the service for one currency rate.
inline void serveRates(PreparedConnection& c, int32_t rights = 4 | 8 | 16 | 32) {
    c.serve("GetUserRights", rightsAnswer(rights));
    c.serve("GetNomCurrRatios", [](const pelta::PropertyBag&) {
        auto b = bag();
        b->writeProperty("List", pelta::Variant(pelta::ObjectRef(ratesList())));
        return b;
    });
    c.serve("GetNomCurrRatiosDetails", [](const pelta::PropertyBag& request) {
        auto id = request.readProperty("ID").toString();
        auto b = bag();
        b->writeProperty("Head", pelta::Variant(pelta::ObjectRef(rateHead(id))));
        b->writeProperty("Rows", pelta::Variant(pelta::ObjectRef(rateRows(id))));
        return b;
    });
    c.serve("UpdNomCurrRatiosDetails", [](const pelta::PropertyBag& request) {
        auto b = bag();
        b->writeProperty("Head", request.readProperty("Head"));
        b->writeProperty("Rows", request.readProperty("Rows"));
        return b;
    });
    c.serve("DelNomCurrRatios", bag());
}

inline ControlDecl control(std::string name, ControlKind kind, std::string caption = {},
                           std::string field = {}) {
    ControlDecl c;
    c.Name = std::move(name);
    c.Kind = kind;
    c.Caption = std::move(caption);
    c.Field = std::move(field);
    return c;
}

inline ColumnDecl column(std::string key, std::string caption, std::string field,
                         bool visible = true) {
    ColumnDecl c;
    c.Key = std::move(key);
    c.Caption = std::move(caption);
    c.Field = std::move(field);
    c.Visible = visible;
    return c;
}

template <class I>
pelta::Ref<I> create(const char* progId) {
    auto o = pelta::queryRef<I>(pelta::createObject(progId));
    if (!o) throw std::logic_error(std::string("The framework offers no ") + progId);
    return o;
}

// Opens the response of a call through the form extender, as screens do.
inline PropertyBagRef callService(IFormExtender* form, IBllConnection* connection,
                                  const std::string& operation, pelta::PropertyBag* request) {
    pelta::Bytes response;
    pelta::ObjectRef context;
    bool ok = false;
    connection->Call(kBllCallKind, operation, request ? request->contents() : pelta::Bytes{},
                     response, 0, context, {}, ok);
    if (!ok) return nullptr;
    return form->CreatePropertyBag(response, kBagConst1, kBagConst2, context);
}

inline RecordsetRef recordsetOf(const pelta::Variant& v) {
    return RecordsetRef(pelta::query<pelta::Recordset>(v.object()));
}

class RatiosDetails : public virtual pelta::Object {
public:
    pelta::Ref<IClientSite> site;
    pelta::Ref<IBllConnection> connection;
    pelta::Ref<IFormExtender> m_oForm;
    pelta::Ref<IGridExtender> m_oGridExt;
    std::string key;
    RecordsetRef head, rows;
    std::vector<bool> referentialsAsked;

    bool frInit(IClientSite* clientSite) {
        site = clientSite;
        connection = site->Connection();
        m_oForm = create<IFormExtender>(kProgIdFormExtender);
        m_oForm->Init(this, "Валутни курсове", "PeltaNom15", "frmRatiosDetails", 2122);
        m_oForm->SetClientSite(site.get());
        m_oForm->SetLayoutKey("{687449F9-346A-40D3-B676-908472759566}");
        m_oForm->DeclareControls({
            control("dtpDate", ControlKind::Date, "Дата", "Date"),
            control("chkIsActive", ControlKind::CheckBox, "Активен", "IsActive"),
            control("cboBank", ControlKind::Combo, "Банка", "Pr_ID"),
            control("txtNote", ControlKind::Note, "Бележка", "Note"),
            control("geRows", ControlKind::Grid, "Курсове"),
        });
        m_oGridExt = create<IGridExtender>(kProgIdGridExtender);
        m_oGridExt->Init(this, "geRows", 2124, {});
        m_oGridExt->DeclareColumns({column("Currency_ID", "Валута", "Currency_ID"),
                                    column("Units", "Единици", "Units"),
                                    column("Ratio", "Курс", "Ratio")});

        auto& e = m_oForm->Events();
        e.Fetch = [this](int32_t step, bool& cancel) { m_oForm_Fetch(step, cancel); };
        e.FillControls = [this] { m_oForm_FillControls(); };
        e.IsModified = [this](bool& modified) { m_oForm_IsModified(modified); };
        e.IsCorrect = [this](bool& cancel) { m_oForm_IsCorrect(cancel); };
        e.Upload = [this] { m_oForm_Upload(); };
        e.Save = [this](bool& cancel) { m_oForm_Save(cancel); };
        e.NewDocument = [this] { key.clear(); };
        e.MovePosition = [this](const pelta::Variant& bookmark) {
            key = bookmark.array().at(0).toString();
        };
        e.BeforeExecute = [this](int32_t id, bool& handled) { m_oForm_BeforeExecute(id, handled); };
        m_oGridExt->Events().BeforeUpdate = [this](bool& cancel) {
            m_oGridExt_BeforeUpdate(cancel);
        };
        return true;
    }

    bool show(const std::string& id) {
        key = id;
        return m_oForm->ShowDocument(id);
    }

    void m_oForm_Fetch(int32_t, bool& cancel) {
        auto request = m_oForm->CreatePropertyBag();
        request->writeProperty("ID", pelta::Variant(key));
        referentialsAsked.push_back(m_oForm->Referentials());
        request->writeProperty("Referentials", pelta::Variant(m_oForm->Referentials()));
        auto response =
            callService(m_oForm.get(), connection.get(), "GetNomCurrRatiosDetails", request.get());
        if (!response) {
            cancel = true;
            return;
        }
        auto newHead = recordsetOf(response->readProperty("Head"));
        auto newRows = recordsetOf(response->readProperty("Rows"));
        if (!key.empty() && (!newHead || newHead->recordCount() == 0)) {
            m_oForm->MsgBox("Номенклатурата не е намерена или недостатъчни права върху данни",
                            vbExclamation);
            cancel = true;
            return;
        }
        head = newHead;
        rows = newRows;
        if (key.empty()) {
            head->addNew();
            head->setValue("IsActive", pelta::Variant(true));
            head->update();
        }
    }

    void m_oForm_FillControls() {
        head->moveFirst();
        m_oForm->SetControlValue("dtpDate", head->value("Date"));
        m_oForm->SetControlValue("chkIsActive", head->value("IsActive"));
        m_oForm->SetControlValue("cboBank", head->value("Pr_ID"));
        m_oForm->SetControlValue("txtNote", head->value("Note"));
        m_oGridExt->Bind(rows);
    }

    static std::string text(const pelta::Variant& v) {
        return v.isNull() || v.isEmpty() ? std::string() : v.toString();
    }

    void m_oForm_IsModified(bool& modified) {
        head->moveFirst();
        modified = text(m_oForm->ControlValue("cboBank")) != text(head->value("Pr_ID")) ||
                   text(m_oForm->ControlValue("txtNote")) != text(head->value("Note")) ||
                   m_oGridExt->EditState();
    }

    void m_oForm_IsCorrect(bool& cancel) {
        cancel = true;
        if (text(m_oForm->ControlValue("cboBank")).empty()) {
            m_oForm->ShowMessage("cboBank", "Моля изберете банка");
            return;
        }
        if (!m_oGridExt->ValidateRows()) return;
        cancel = false;
    }

    void m_oForm_Upload() {
        head->moveFirst();
        head->setValue("Pr_ID", m_oForm->ControlValue("cboBank"));
        head->setValue("Note", m_oForm->ControlValue("txtNote"));
        head->setValue("LU", pelta::Variant(connection->CurrentUserName()));
        head->update();
    }

    void m_oForm_Save(bool& cancel) {
        auto request = m_oForm->CreatePropertyBag();
        request->writeProperty("Head", pelta::Variant(pelta::ObjectRef(head)));
        request->writeProperty("Rows", pelta::Variant(pelta::ObjectRef(rows)));
        request->writeProperty("NeedList", pelta::Variant("ctxRatios"));
        auto response =
            callService(m_oForm.get(), connection.get(), "UpdNomCurrRatiosDetails", request.get());
        if (!response) {
            cancel = true;
            return;
        }
        auto error = response->readProperty("BllError");
        if (!error.isEmpty()) {
            m_oForm->MsgBox("Грешка " + error.toString(), vbCritical);
            cancel = true;
            return;
        }
        head = recordsetOf(response->readProperty("Head"));
        rows = recordsetOf(response->readProperty("Rows"));
    }

    void m_oForm_BeforeExecute(int32_t id, bool& handled) {
        if (id != kCmdDelete) return;
        handled = true;
        if (m_oForm->AskYesNo("Желаете ли да изтриете номенклатурата?") != vbYes) return;
        auto services = create<IFrameworkServices>(kProgIdFrameworkServices);
        if (services->RecordDeletion()->DeleteRecord(connection.get(), m_oForm.get(), kBllCallKind,
                                                     "DelNomCurrRatios", "ID", key))
            m_oForm->CloseDocument();
    }

    void m_oGridExt_BeforeUpdate(bool& cancel) {
        if (text(m_oGridExt->CurrentValue("Units")).empty()) {
            m_oForm->ShowMessage("geRows", "Моля въведете единица валута");
            cancel = true;
        } else if (text(m_oGridExt->CurrentValue("Ratio")).empty()) {
            m_oForm->ShowMessage("geRows", "Моля въведете курс");
            cancel = true;
        }
    }
};

class RatiosList : public virtual pelta::Object {
public:
    pelta::Ref<IClientSite> site;
    pelta::Ref<IBllConnection> connection;
    pelta::Ref<IFormExtender> m_oForm;
    pelta::Ref<IGridExtender> m_oGridExt;
    pelta::Ref<IDetailOpener> m_oOpener;
    RecordsetRef m_rsList;
    pelta::Ref<RatiosDetails> m_oDetails;  // the cached detail form
    int detailsCreated = 0;

    bool InitClientSite(IClientSite* clientSite) {
        site = clientSite;
        connection = site->Connection();
        m_oForm = create<IFormExtender>(kProgIdFormExtender);
        m_oForm->Init(this, "Валутни курсове", "PeltaNom15", "ctxRatios", 2121);
        m_oForm->SetClientSite(site.get());
        m_oGridExt = create<IGridExtender>(kProgIdGridExtender);
        m_oGridExt->Init(this, "geCtl", 2123, "{E604AA9E-3601-4FDE-93D8-86CFC5920C47}");
        m_oForm->RegisterDetailForm("frmRatiosDetails");
        m_oForm->RemoveCommands({502, 202, 204, 304, 506, 103, 201});
        m_oForm->SetCommandCaption(kCmdNew, "Нов валутен курс...\tCtrl+N");
        m_oForm->SetCommandTooltip(kCmdNew, "Нов валутен курс (Ctrl+N)");
        m_oForm->SetCommandCaption(kCmdOpen, "Редакция валутен курс...\tCtrl+O");
        m_oForm->SetCommandTooltip(kCmdOpen, "Редакция на валутен курс (Ctrl+O)");
        m_oForm->SetCommandTooltip(kCmdDeleteInactive, "Изтриване на неактивен валутен курс (Del)");
        m_oOpener = create<IDetailOpener>(kProgIdDetailOpener);
        m_oOpener->Init(site.get(), "{687449F9-346A-40D3-B676-908472759566}", "ctxRatios");

        m_oForm->Events().Fetch = [this](int32_t, bool& cancel) {
            auto response =
                callService(m_oForm.get(), connection.get(), "GetNomCurrRatios", nullptr);
            if (!response) {
                cancel = true;
                return;
            }
            m_rsList = recordsetOf(response->readProperty("List"));
            if (!m_rsList) cancel = true;
        };
        m_oForm->Events().FillControls = [this] {
            m_oGridExt->Bind(m_rsList, "PrName", pelta::Variant("(Всички)"));
            m_oGridExt->Refresh();
        };
        m_oForm->Events().BeforeExecute = [this](int32_t id, bool& handled) {
            m_oForm_BeforeExecute(id, handled);
        };
        m_oGridExt->Events().BeforeDelete = [](bool& cancel) { cancel = true; };
        return true;
    }

    pelta::Ref<RatiosDetails> getDetails() {
        if (!m_oOpener->HasRight(kRightOpenDetails)) return nullptr;
        auto services = create<IFrameworkServices>(kProgIdFrameworkServices);
        auto open = services->RecordDeletion()->FindDetailForm(m_oForm.get());
        if (auto* found = pelta::query<RatiosDetails>(open.get()))
            return pelta::Ref<RatiosDetails>(found);
        auto details = pelta::makeRef<RatiosDetails>();
        if (!details->frInit(site.get())) return nullptr;
        ++detailsCreated;
        m_oDetails = details;
        return details;
    }

    void m_oForm_BeforeExecute(int32_t id, bool& handled) {
        switch (id) {
            case kCmdNew:
                handled = true;
                if (auto d = getDetails()) d->show({});
                break;
            case kCmdOpen: {
                handled = true;
                auto key = m_oGridExt->CurrentValue("ID");
                if (key.isEmpty() || key.isNull()) return;
                if (auto d = getDetails()) d->show(key.toString());
                break;
            }
            case kCmdDeleteInactive: {
                handled = true;
                if (m_oForm->AskYesNo("Желаете ли да изтриете избраните неактивни номенклатури?") !=
                    vbYes)
                    return;
                auto services = create<IFrameworkServices>(kProgIdFrameworkServices);
                services->RecordDeletion()->DeleteRecords(connection.get(), m_oGridExt.get(),
                                                          m_oForm.get(), kBllCallKind,
                                                          "DelNomCurrRatios", "ID", true);
                break;
            }
            case kCmdRefresh:
                handled = true;
                m_oForm->Refresh();
                break;
            default:
                break;
        }
    }
};

}  // namespace fwtest
