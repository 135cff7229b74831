// The partner editor's rules: the default person of natural persons and
// employees, the checks before a save in their order, the default partner
// dimension, the copy of a partner and the duplicate codes a save is refused
// for.
#include <set>

#include "library/contracts/Constants.h"
#include "library/frame/mdErrorHandling.h"
#include "library/frame/mdFilter.h"
#include "library/frame/mdGlobals.h"
#include "library/partners/frmContragentsDetails.h"
#include "library/partners/mdCgChecks.h"
#include "platform/automation/guid.h"
#include "platform/data/propertybag.h"
#include "platform/data/recordset.h"

namespace PeltaNom15 {

namespace {

constexpr const char* kObjectName = "frmContragentsDetails";
constexpr const char* kCaption = "Контрагент";
constexpr const char* kCodeHint =
    "Използвайте текстовото поле, за да модифицирате кода или го оставете празно за автоматична "
    "генерация на пореден уникален номер.";

std::string Trim(const std::string& Text) {
    const auto b = Text.find_first_not_of(" \t");
    if (b == std::string::npos) return {};
    return Text.substr(b, Text.find_last_not_of(" \t") - b + 1);
}

bool StartsWithDigit(const std::string& Text) {
    return !Text.empty() && Text[0] >= '0' && Text[0] <= '9';
}

// Rows that are not deleted, counted.
int64_t LiveRows(const RecordsetRef& Rows) {
    if (!Rows || Rows->recordCount() == 0) return 0;
    int64_t n = 0;
    auto r = Rows->clone();
    for (r->moveFirst(); !r->eof(); r->moveNext())
        if (r->status() != pelta::RowStatus::Deleted) ++n;
    return n;
}

// Any live row with the flag set.
bool AnyFlag(const RecordsetRef& Rows, const char* Field) {
    if (!Rows || Rows->recordCount() == 0 || Rows->fieldIndex(Field) < 0) return false;
    auto r = Rows->clone();
    for (r->moveFirst(); !r->eof(); r->moveNext())
        if (r->status() != pelta::RowStatus::Deleted && C2Bool(r->value(Field))) return true;
    return false;
}

bool IsAudit(const std::string& Field) {
    return Field == "CU" || Field == "CD" || Field == "LU" || Field == "LD";
}

bool IsLink(const std::string& Field) {
    return Field.size() > 3 && Field.compare(Field.size() - 3, 3, "_ID") == 0 && Field != "Cg_ID";
}

}  // namespace

bool frmContragentsDetails::pvIsNaturalPersonType(const std::string& TypeID) {
    if (TypeID.empty()) return false;
    for (const char* p : {"CgTypeNaturalPerson_ID", "CgTypeEmployee_ID"})
        if (C2Str(pvParameter(p)) == TypeID) return true;
    return false;
}

// ---- the default person -----------------------------------------------------------

void frmContragentsDetails::pvSyncDefaultPerson() {
    try {
        if (!m_rsHead || !pvIsNaturalPersonType(pvText("cboCgType"))) return;
        auto persons = Rows("Person");
        if (!persons) return;
        const std::string name = Trim(pvText("txtName"));
        const pelta::Variant user(m_oConnection->CurrentUserID());
        const pelta::Variant now(pelta::now());
        auto p = persons->clone();
        if (p->recordCount() > 0) {
            for (p->moveFirst(); !p->eof(); p->moveNext()) {
                if (p->status() == pelta::RowStatus::Deleted || !C2Bool(p->value("IsDefMol")))
                    continue;
                // The person mirrors the partner's name.
                if (!name.empty() && C2Str(p->value("Name")) != name) {
                    p->setValue("Name", pelta::Variant(name));
                    p->setValue("LU", user);
                    p->setValue("LD", now);
                    p->update();
                    m_oGrids["gePersons"]->Refresh();
                }
                return;
            }
        }
        if (name.empty()) return;
        const bool defOsp = AnyFlag(persons, "IsDefOsp");
        const bool contact = AnyFlag(persons, "IsContact");
        p->addNew();
        p->setValue("ID", pelta::Variant(pelta::newGuidString()));
        p->setValue("Cg_ID", m_rsHead->value("ID"));
        p->setValue("Name", pelta::Variant(name));
        for (const char* flag : {"IsActive", "IsMol", "IsOsp", "IsDefMol"})
            p->setValue(flag, pelta::Variant(true));
        p->setValue("IsDefOsp", pelta::Variant(!defOsp));
        p->setValue("IsContact", pelta::Variant(!contact));
        p->setValue("CU", user);
        p->setValue("CD", now);
        p->setValue("LU", user);
        p->setValue("LD", now);
        p->update();
        m_oGrids["gePersons"]->Refresh();
    } catch (...) {
        ShowError("pvSyncDefaultPerson", kObjectName, kCaption);
    }
}

// ---- the checks before a save -------------------------------------------------------

bool frmContragentsDetails::pvCheckHead() {
    if (Trim(pvText("txtName")).empty()) {
        m_oForm->ShowMessage("txtName", "Невалидно име");
        return false;
    }
    if (Trim(pvText("txtAddress")).empty()) {
        m_oForm->ShowMessage("txtAddress", "Невалиден адрес");
        return false;
    }
    // A number without country letters belongs in the identification number.
    if (m_sKey.empty() && StartsWithDigit(Trim(pvText("txtTaxNo"))) &&
        !StartsWithDigit(Trim(pvText("txtBulstat")))) {
        const pelta::Variant taxNo = m_oForm->ControlValue("txtTaxNo");
        m_oForm->SetControlValue("txtTaxNo", m_oForm->ControlValue("txtBulstat"));
        m_oForm->SetControlValue("txtBulstat", taxNo);
    }
    const std::string reason = CheckIdentNumber(pvText("txtBulstat"));
    if (!reason.empty()) {
        m_oForm->ShowMessage("txtBulstat", reason, "Невалиден Идент. No.",
                             "Ако желаете номерът да не се валидира въведете интервал в началото.");
        return false;
    }
    if (pvText("cboCgType").empty()) {
        m_oForm->ShowMessage("cboCgType", "Невалиден тип на контрагент");
        return false;
    }
    return true;
}

bool frmContragentsDetails::pvIsCorrect() {
    if (!pvCheckHead() || !pvCheckDimension()) return false;
    const std::string store = C2Str(pvParameter("CgTypeStore_ID"));
    if (pvText("cboCgType") != store && LiveRows(Rows("Person")) == 0) {
        m_oForm->ShowMessage(
            "gePersons",
            "За потвърждаване на данните на контрагента, задължително трябва да бъде въведена "
            "поне една персона.",
            "Липсва персона.",
            "Персоната е задължителен реквизит на всички документи. Лицето което е посочено по "
            "подразбиране ще излиза автоматично на всички документи при избор на контрагента.");
        return false;
    }
    if (C2Bool(m_oForm->ControlValue("attIsDepRequired")) && LiveRows(Rows("Departments")) == 0) {
        m_oForm->ShowMessage("attIsDepRequired",
                             "Невъзможно изискване на задължително поделение при продажба, защото "
                             "липсват поделения на контрагента.",
                             "Невалидна стойност",
                             "Използвайте списък Поделения за да добавите поне едно поделение на "
                             "контрагента.");
        return false;
    }
    for (const char* grid : {"gePersons", "geAddresses", "geBankAcc", "geDepartments"})
        if (!m_oGrids[grid]->ValidateRows()) return false;
    return true;
}

// ---- the default partner dimension --------------------------------------------------

RecordsetRef frmContragentsDetails::pvDefaultDimension() {
    const std::string id = C2Str(pvParameter("DefCgDimension_ID"));
    auto dims = Reference("Dimensions");
    if (id.empty() || !dims || dims->recordCount() == 0) return {};
    auto d = dims->clone();
    if (!d->find("ID = " + FilterLiteral(id))) return {};
    return d;
}

namespace {

// The values of `Dimension` the partner has.
std::set<std::string> StoredValues(const RecordsetRef& Links, const std::string& Dimension) {
    std::set<std::string> out;
    if (!Links || Links->recordCount() == 0) return out;
    auto l = Links->clone();
    for (l->moveFirst(); !l->eof(); l->moveNext())
        if (l->status() != pelta::RowStatus::Deleted &&
            C2Str(l->value("Dimension_ID")) == Dimension)
            out.insert(C2Str(l->value("DimValue_ID")));
    return out;
}

}  // namespace

void frmContragentsDetails::pvBindDimension() {
    auto dim = pvDefaultDimension();
    m_rsDimChoice.reset();
    if (!dim) return;
    const std::string id = C2Str(dim->value("ID"));
    const auto stored = StoredValues(Rows("CgDimensions"), id);
    auto values = Reference("DimValues");
    if (C2Lng(dim->value("ValueType")) == 7) {
        m_rsDimChoice = pelta::makeRef<pelta::Recordset>();
        m_rsDimChoice->appendField("ID", pelta::FieldType::Guid);
        m_rsDimChoice->appendField("Name", pelta::FieldType::Text);
        m_rsDimChoice->appendField("Checked", pelta::FieldType::Boolean);
        m_rsDimChoice->open();
        if (values && values->recordCount() > 0) {
            auto v = values->clone();
            for (v->moveFirst(); !v->eof(); v->moveNext()) {
                if (C2Str(v->value("Dimension_ID")) != id) continue;
                m_rsDimChoice->addNew();
                m_rsDimChoice->setValue("ID", v->value("ID"));
                m_rsDimChoice->setValue("Name", v->value("Name"));
                m_rsDimChoice->setValue("Checked",
                                        pelta::Variant(stored.count(C2Str(v->value("ID"))) > 0));
                m_rsDimChoice->update();
            }
        }
        m_rsDimChoice->updateBatch();
        m_oGrids["geCgDimension"]->Bind(m_rsDimChoice);
        return;
    }
    if (values) {
        auto own = values->clone();
        own->setFilter("Dimension_ID = " + FilterLiteral(id));
        m_oForm->SetControlList("cboCgDimension", own, "ID", {"Name"});
    }
    m_oForm->SetControlValue("cboCgDimension",
                             stored.empty() ? pelta::Variant() : pelta::Variant(*stored.begin()));
}

namespace {

std::set<std::string> ChosenValues(IFormExtender* Form, const RecordsetRef& Choice,
                                   int32_t ValueType) {
    std::set<std::string> out;
    if (ValueType == 7) {
        if (!Choice || Choice->recordCount() == 0) return out;
        auto c = Choice->clone();
        for (c->moveFirst(); !c->eof(); c->moveNext())
            if (C2Bool(c->value("Checked"))) out.insert(C2Str(c->value("ID")));
        return out;
    }
    const std::string value = C2Str(Form->ControlValue("cboCgDimension"));
    if (!value.empty()) out.insert(value);
    return out;
}

}  // namespace

bool frmContragentsDetails::pvDimensionModified() {
    auto dim = pvDefaultDimension();
    if (!dim) return false;
    const std::string id = C2Str(dim->value("ID"));
    return ChosenValues(m_oForm.get(), m_rsDimChoice, C2Lng(dim->value("ValueType"))) !=
           StoredValues(Rows("CgDimensions"), id);
}

bool frmContragentsDetails::pvCheckDimension() {
    auto dim = pvDefaultDimension();
    if (!dim || !C2Bool(dim->value("IsRequired"))) return true;
    const int32_t type = C2Lng(dim->value("ValueType"));
    if (!ChosenValues(m_oForm.get(), m_rsDimChoice, type).empty()) return true;
    m_oForm->ShowMessage(type == 7 ? "geCgDimension" : "cboCgDimension", "Невалидна дименсия");
    return false;
}

void frmContragentsDetails::pvUploadDimension() {
    auto dim = pvDefaultDimension();
    auto links = Rows("CgDimensions");
    if (!dim || !links) return;
    const std::string id = C2Str(dim->value("ID"));
    auto chosen = ChosenValues(m_oForm.get(), m_rsDimChoice, C2Lng(dim->value("ValueType")));
    auto l = links->clone();
    if (l->recordCount() > 0) {
        for (l->moveFirst(); !l->eof(); l->moveNext()) {
            if (l->status() == pelta::RowStatus::Deleted || C2Str(l->value("Dimension_ID")) != id)
                continue;
            // A value kept stays; one no longer chosen goes.
            if (chosen.erase(C2Str(l->value("DimValue_ID"))) == 0) l->deleteRecord();
        }
    }
    for (const std::string& value : chosen) {
        l->addNew();
        l->setValue("ID", pelta::Variant(pelta::newGuidString()));
        l->setValue("Cg_ID", m_rsHead->value("ID"));
        l->setValue("Dimension_ID", pelta::Variant(id));
        l->setValue("DimValue_ID", pelta::Variant(value));
        l->update();
    }
}

// ---- the copy of a partner (318) ------------------------------------------------------

void frmContragentsDetails::pvCaptureCopy() {
    if (!m_rsHead || m_rsHead->recordCount() == 0) return;
    pvUploadDimension();
    CopySource source;
    m_rsHead->moveFirst();
    for (size_t i = 0; i < m_rsHead->fieldCount(); ++i) {
        const std::string& field = m_rsHead->fieldDef(i).name;
        pelta::Variant value = m_rsHead->value(i);
        // What is on screen, edited or not.
        for (const auto& c : m_oDef.Controls)
            if (c.Field == field && !c.ReadOnly) value = pvControlField(c.Name);
        source.Head.emplace_back(field, std::move(value));
    }
    for (const std::string& name : SubLists())
        if (auto rows = Rows(name)) source.Rows[name] = rows;
    m_oCopy = std::move(source);
}

void frmContragentsDetails::pvTakeCopy() {
    const std::string id = pelta::newGuidString();
    const pelta::Variant user(m_oConnection->CurrentUserID());
    const pelta::Variant now(pelta::now());
    // Every row of the source gets a key of its own; links between the rows
    // follow their rows.
    std::map<std::string, std::string> keys;
    for (const auto& [name, rows] : m_oCopy->Rows) {
        if (rows->fieldIndex("ID") < 0 || rows->recordCount() == 0) continue;
        auto r = rows->clone();
        for (r->moveFirst(); !r->eof(); r->moveNext())
            if (r->status() != pelta::RowStatus::Deleted)
                keys[C2Str(r->value("ID"))] = pelta::newGuidString();
    }
    auto remap = [&](const std::string& field, const pelta::Variant& value) {
        if (!IsLink(field)) return value;
        auto it = keys.find(C2Str(value));
        return it == keys.end() ? value : pelta::Variant(it->second);
    };
    for (const auto& [field, value] : m_oCopy->Head) {
        if (field == "ID" || field == "Code" || IsAudit(field) || m_rsHead->fieldIndex(field) < 0)
            continue;
        m_rsHead->setValue(field, remap(field, value));
    }
    m_rsHead->setValue("ID", pelta::Variant(id));
    for (const auto& [name, source] : m_oCopy->Rows) {
        auto target = Rows(name);
        if (!target || source->recordCount() == 0) continue;
        auto r = source->clone();
        for (r->moveFirst(); !r->eof(); r->moveNext()) {
            if (r->status() == pelta::RowStatus::Deleted) continue;
            target->addNew();
            for (size_t i = 0; i < target->fieldCount(); ++i) {
                const std::string& field = target->fieldDef(i).name;
                if (r->fieldIndex(field) < 0) continue;
                pelta::Variant v = r->value(field);
                if (field == "ID")
                    v = pelta::Variant(keys[C2Str(v)]);
                else if (field == "Cg_ID")
                    v = pelta::Variant(id);
                else if (field == "CU" || field == "LU")
                    v = user;
                else if (field == "CD" || field == "LD")
                    v = now;
                else if (field == "Code")
                    v = pelta::Variant::null();  // codes are unique across partners
                else
                    v = remap(field, v);
                target->setValue(i, v);
            }
            target->update();
        }
    }
    m_bFromCopy = true;
}

// ---- refusals of a save ---------------------------------------------------------------

bool frmContragentsDetails::pvDuplicateCode(pelta::PropertyBag& Response) {
    auto text = [&](const char* name) { return C2Str(Response.readProperty(name)); };
    const std::string partner = text("BllContragent");
    const std::string row = text("BllRowID");
    if (!text("BllPrs_ID").empty()) {
        if (!row.empty()) m_oGrids["gePersons"]->MoveToRow(FilterEquals("Code", row));
        m_oForm->ShowMessage("gePersons",
                             Printf("Вече съществува персона '%1' на контрагент '%2' с този код.",
                                    text("BllPerson"), partner),
                             "Дублиране на код");
    } else if (!text("BllBankAcc_ID").empty()) {
        if (!row.empty()) m_oGrids["geBankAcc"]->MoveToRow(FilterEquals("ID", row));
        m_oForm->ShowMessage("geBankAcc",
                             Printf("Вече съществува банкова сметка '%1' на контрагент '%2' с "
                                    "този IBAN и BIC.",
                                    text("BllBankAccount"), partner),
                             "Дублиране на запис в банкови сметки",
                             "Използвайте текстовите полета, за да модифицирате IBAN и/или BIC.");
    } else if (!text("BllDep_ID").empty()) {
        if (!row.empty()) m_oGrids["geDepartments"]->MoveToRow(FilterEquals("Code", row));
        m_oForm->ShowMessage("geDepartments",
                             Printf("Вече съществува поделение '%1' на контрагент '%2' с този код.",
                                    text("BllDepartment"), partner),
                             "Дублиране на код");
    } else {
        m_oForm->ShowMessage("txtCode",
                             Printf("Вече съществува контрагент '%1' с този код", partner),
                             "Дублиране на код", kCodeHint);
    }
    return true;
}

}  // namespace PeltaNom15
