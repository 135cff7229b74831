// Business partners: the list with its restrictions, one partner with its
// persons, delivery addresses, bank accounts, departments and dimension
// values, the save with its duplicate checks, and the delete.
#include <algorithm>
#include <cctype>
#include <optional>

#include "bll/operations.h"
#include "bll/service.h"
#include "platform/automation/guid.h"

namespace pelta::bll {

namespace {

constexpr char kScreen[] = "ctxContragents";
constexpr char kTable[] = "nom_contragents";

// Refusals of partners beyond the common ones.
constexpr int32_t kDuplicateBulstat = 8108;
constexpr int32_t kDuplicateTaxNo = 8109;

// At most this many partner types restrict a list.
constexpr size_t kMaxTypes = 200;

Ref<Recordset> emptySubList() {
    return emptyList({field("ID", FieldType::Guid), field("Cg_ID", FieldType::Guid)});
}

Variant setting(Database& db, const char* name) {
    auto st = db.prepare("SELECT Value FROM sys_settings WHERE Name = ?1");
    st->bindText(1, name);
    if (!st->step() || st->isNull(0)) return Variant::null();
    return Variant(std::string(st->text(0)));
}

// --- The list -----------------------------------------------------------------

struct Restrictions {
    std::vector<std::string> types;   // partner types, any of them
    std::vector<std::string> types2;  // a second set the type must also be in
    std::string dimension;            // a dimension value the partner has
    std::string dimValue;
};

std::vector<std::string> splitList(std::string_view text) {
    std::vector<std::string> out;
    std::string cur;
    auto flush = [&] {
        std::string t = trimmed(Variant(cur));
        if (!t.empty() && out.size() < kMaxTypes) out.push_back(t);
        cur.clear();
    };
    for (char c : text) {
        if (c == '\x01' || c == ',' || c == ';')
            flush();
        else
            cur.push_back(c);
    }
    flush();
    return out;
}

Restrictions readRestrictions(const OperationContext& ctx) {
    Restrictions r;
    r.types = splitList(ctx.text("CgTypes"));
    r.types2 = splitList(ctx.text("CgTypes2"));
    r.dimension = ctx.text("Dimension_ID");
    r.dimValue = ctx.text("DimValue_ID");
    return r;
}

constexpr const char* kListSelect =
    "SELECT c.ID, c.Code, c.Name, c.CgType_ID, t.Name AS CgTypeName, c.TaxNo, c.Bulstat, "
    "c.DvskNo, c.Address, c.CorrespAddress, NULL AS CountryName, NULL AS CityName, "
    "c.PostalCode, a.Name AS DeliveryAddress, c.CreditLimitation, c.InvDaysPostponePmt, "
    "c.SupDaysPostponePmt, c.Phone, c.Fax, c.Email, c.WebAddress, po.Name AS PrsOspName, "
    "NULL AS PriceListName, NULL AS DiscountName, NULL AS BonusName, NULL AS FltCategories, "
    "io.Name AS InvCgOwnName, dm.Name AS DefMolName, dm.Egn AS DefMolEgn, "
    "(c.CgType_ID IS ?1) AS IsEmployee, c.WayOfPayment, ct.Name AS ContactName, "
    "ct.Email AS ContactEmail, ct.PhoneWork AS ContactPhoneWork, "
    "ct.PhoneMobile AS ContactPhoneMobile, 0 AS NumAttachments, c.MaxDaysInArrears, "
    "c.License, c.LicenseMi, c.PosCards, c.Name2, c.Note, c.IsActive, "
    "(SELECT group_concat(v.Name, '; ') FROM nom_cgdimlinks l "
    "JOIN nom_cgdimvalues v ON v.ID = l.DimValue_ID "
    "WHERE l.Cg_ID = c.ID AND l.Dimension_ID = ?2) AS DimValueName, "
    "c.CU, c.CD, c.LU, c.LD, c.NoteRtf, NULL AS MediaThumbData";

constexpr const char* kListFrom =
    " FROM nom_contragents c JOIN nom_cgtypes t ON t.ID = c.CgType_ID "
    "LEFT JOIN nom_cgaddresses a ON a.ID = c.DeliveryAddress_ID "
    "LEFT JOIN nom_cgpersons po ON po.ID = c.PrsOsp_ID "
    "LEFT JOIN nom_contragents io ON io.ID = c.InvCgOwn_ID "
    "LEFT JOIN nom_cgpersons dm ON dm.ID = (SELECT p.ID FROM nom_cgpersons p "
    "WHERE p.Cg_ID = c.ID AND p.IsDefMol = 1 ORDER BY p.Name LIMIT 1) "
    "LEFT JOIN nom_cgpersons ct ON ct.ID = (SELECT p.ID FROM nom_cgpersons p "
    "WHERE p.Cg_ID = c.ID AND p.IsContact = 1 ORDER BY p.Name LIMIT 1)";

struct Dimension {
    std::string id;
    std::string code;
};

std::vector<Dimension> activeDimensions(Database& db) {
    std::vector<Dimension> out;
    auto st = db.prepare("SELECT ID, Code FROM nom_cgdimensions WHERE IsActive = 1 ORDER BY Code");
    while (st->step())
        out.push_back({std::string(st->text(0)), std::string(st->text(1))});
    return out;
}

// The partners' list: every partner the restrictions allow, or the one of
// `key`. Each active dimension adds a column named by its code holding the
// partner's value names joined by "; ".
Ref<Recordset> readPartners(Database& db, const Restrictions& r, const std::string& key = {}) {
    std::vector<Variant> params{setting(db, "CgTypeEmployee_ID"), setting(db, "DefCgDimension_ID")};
    auto next = [&](Variant v) {
        params.push_back(std::move(v));
        return "?" + std::to_string(params.size());
    };
    std::string sql = kListSelect;
    std::vector<std::string> taken;
    for (const Dimension& d : activeDimensions(db)) {
        // A code that repeats a column of the list would hide it.
        auto same = [&](const std::string& name) {
            return std::equal(name.begin(), name.end(), d.code.begin(), d.code.end(),
                              [](char a, char b) { return std::tolower(a) == std::tolower(b); });
        };
        static const char* const kFixed[] = {"ID",
                                             "Code",
                                             "Name",
                                             "CgType_ID",
                                             "CgTypeName",
                                             "TaxNo",
                                             "Bulstat",
                                             "DvskNo",
                                             "Address",
                                             "CorrespAddress",
                                             "CountryName",
                                             "CityName",
                                             "PostalCode",
                                             "DeliveryAddress",
                                             "CreditLimitation",
                                             "InvDaysPostponePmt",
                                             "SupDaysPostponePmt",
                                             "Phone",
                                             "Fax",
                                             "Email",
                                             "WebAddress",
                                             "PrsOspName",
                                             "PriceListName",
                                             "DiscountName",
                                             "BonusName",
                                             "FltCategories",
                                             "InvCgOwnName",
                                             "DefMolName",
                                             "DefMolEgn",
                                             "IsEmployee",
                                             "WayOfPayment",
                                             "ContactName",
                                             "ContactEmail",
                                             "ContactPhoneWork",
                                             "ContactPhoneMobile",
                                             "NumAttachments",
                                             "MaxDaysInArrears",
                                             "License",
                                             "LicenseMi",
                                             "PosCards",
                                             "Name2",
                                             "Note",
                                             "IsActive",
                                             "DimValueName",
                                             "CU",
                                             "CD",
                                             "LU",
                                             "LD",
                                             "NoteRtf",
                                             "MediaThumbData"};
        bool clash = d.code.empty() || std::any_of(std::begin(kFixed), std::end(kFixed),
                                                   [&](const char* f) { return same(f); });
        clash = clash || std::any_of(taken.begin(), taken.end(), same);
        if (clash) continue;
        taken.push_back(d.code);
        sql +=
            ", (SELECT group_concat(v.Name, '; ') FROM nom_cgdimlinks l "
            "JOIN nom_cgdimvalues v ON v.ID = l.DimValue_ID WHERE l.Cg_ID = c.ID AND "
            "l.Dimension_ID = " +
            next(Variant(d.id)) + ") AS " + db.quote(d.code);
    }
    sql += kListFrom;
    std::vector<std::string> where;
    if (!key.empty()) where.push_back("c.ID = " + next(Variant(key)));
    for (const auto* types : {&r.types, &r.types2}) {
        if (types->empty()) continue;
        std::string in;
        for (const std::string& t : *types)
            in += (in.empty() ? "" : ", ") + next(Variant(t));
        where.push_back("c.CgType_ID IN (" + in + ")");
    }
    if (!r.dimValue.empty()) {
        std::string cond =
            "EXISTS (SELECT 1 FROM nom_cgdimlinks l WHERE l.Cg_ID = c.ID AND "
            "l.DimValue_ID = " +
            next(Variant(r.dimValue));
        if (!r.dimension.empty()) cond += " AND l.Dimension_ID = " + next(Variant(r.dimension));
        where.push_back(cond + ")");
    }
    for (size_t i = 0; i < where.size(); ++i)
        sql += (i ? " AND " : " WHERE ") + where[i];
    sql += " ORDER BY c.Name";
    const FieldDef shapes[] = {
        field("IsEmployee", FieldType::Boolean), field("NumAttachments", FieldType::Long),
        field("CountryName", FieldType::Text),   field("CityName", FieldType::Text),
        field("PriceListName", FieldType::Text), field("DiscountName", FieldType::Text),
        field("BonusName", FieldType::Text),     field("FltCategories", FieldType::Text),
        field("DimValueName", FieldType::Text),  field("MediaThumbData", FieldType::Binary)};
    return readRecordset(db, sql, params, shapes);
}

void getNomContragents(OperationContext& ctx) {
    if (ctx.rightsOf(kScreen) == 0) throw Refusal(bllerr::NoRights);
    ctx.response.writeProperty("List", Variant(readPartners(ctx.db, readRestrictions(ctx))));
    ctx.response.writeProperty(
        "Type", Variant(readRecordset(ctx.db,
                                      "SELECT ID, Code, Name, IsDef FROM nom_cgtypes "
                                      "WHERE IsActive = 1 ORDER BY Name")));
    ctx.response.writeProperty("Dimensions",
                               Variant(readRecordset(ctx.db,
                                                     "SELECT ID, Code, Name, ValueType, IsRequired "
                                                     "FROM nom_cgdimensions WHERE IsActive = 1 "
                                                     "ORDER BY Code")));
    ctx.response.writeProperty(
        "DimValues", Variant(readRecordset(ctx.db,
                                           "SELECT v.ID, v.Dimension_ID, v.Code, v.Name "
                                           "FROM nom_cgdimvalues v JOIN nom_cgdimensions d "
                                           "ON d.ID = v.Dimension_ID WHERE v.IsActive = 1 "
                                           "ORDER BY d.Code, v.Name")));
    ctx.response.writeProperty(
        "CustomFormats",
        Variant(emptyList({field("ID", FieldType::Guid), field("Name", FieldType::Text),
                           field("Format", FieldType::Text)})));
}

// --- One partner --------------------------------------------------------------

struct SubList {
    const char* property;
    const char* table;  // null: kept by another part of the system
    const char* select;
    bool audit;
};

const SubList kSubLists[] = {
    {"PriceList", nullptr, nullptr, false},
    {"Person", "nom_cgpersons", "SELECT * FROM nom_cgpersons WHERE Cg_ID = ?1 ORDER BY Name", true},
    {"BankAcc", "nom_cgbankaccounts",
     "SELECT * FROM nom_cgbankaccounts WHERE Cg_ID = ?1 ORDER BY Name", false},
    {"Departments", "nom_cgdepartments",
     "SELECT * FROM nom_cgdepartments WHERE Cg_ID = ?1 ORDER BY Name", false},
    {"ItemsCodes", nullptr, nullptr, false},
    {"SupplCodes", nullptr, nullptr, false},
    {"CgBonuses", nullptr, nullptr, false},
    {"CgMinQuo", nullptr, nullptr, false},
    {"DealersDeps", nullptr, nullptr, false},
    {"CgCodes", nullptr, nullptr, false},
    {"CgDimensions", "nom_cgdimlinks",
     "SELECT l.ID, l.Cg_ID, l.Dimension_ID, l.DimValue_ID, v.Name AS DimValueName "
     "FROM nom_cgdimlinks l JOIN nom_cgdimvalues v ON v.ID = l.DimValue_ID "
     "WHERE l.Cg_ID = ?1 ORDER BY v.Name",
     false},
    {"CgAttachments", nullptr, nullptr, false},
    {"CgAddresses", "nom_cgaddresses",
     "SELECT * FROM nom_cgaddresses WHERE Cg_ID = ?1 ORDER BY IsDefault DESC, Name", false},
};

void answerPartner(OperationContext& ctx, const std::string& id) {
    Variant key[] = {Variant(id)};
    auto head = readRecordset(ctx.db, "SELECT * FROM nom_contragents WHERE ID = ?1", key);
    ctx.response.writeProperty("Head", Variant(head));
    for (const SubList& s : kSubLists) {
        Ref<Recordset> rows = s.select ? readRecordset(ctx.db, s.select, key) : emptySubList();
        ctx.response.writeProperty(s.property, Variant(rows));
    }
    ctx.response.writeProperty("Count", Variant(static_cast<int32_t>(head->recordCount())));
}

void answerReferentials(OperationContext& ctx) {
    auto put = [&](const char* name, Ref<Recordset> rs) {
        ctx.response.writeProperty(name, Variant(std::move(rs)));
    };
    put("ContragentType", readRecordset(ctx.db,
                                        "SELECT ID, Code, Name, IsDef FROM nom_cgtypes "
                                        "WHERE IsActive = 1 ORDER BY Name"));
    put("PriceListType", emptyKeyed());
    put("Currency",
        readRecordset(ctx.db, "SELECT ID, Code, Name FROM nom_currencies ORDER BY Code"));
    put("PersonPosition", emptyKeyed());
    put("Measures", emptyKeyed());
    put("DiscountSchema", emptyKeyed());
    put("Osp", emptyKeyed());
    put("OwnPersons", emptyKeyed());
    put("Accounts", emptyKeyed());
    put("ItmDimensions", emptyKeyed());
    put("ItmDimValues", emptyKeyed());
    put("Countries", emptyKeyed());
    put("Bonuses",
        emptyList({field("ID", FieldType::Guid), field("Code", FieldType::Text),
                   field("Name", FieldType::Text), field("BonusType", FieldType::Long)}));
    put("ObjectType", emptyKeyed());
    put("Dimensions", readRecordset(ctx.db,
                                    "SELECT ID, Code, Name, ValueType, IsRequired "
                                    "FROM nom_cgdimensions WHERE IsActive = 1 ORDER BY Code"));
    put("DimValues", readRecordset(ctx.db,
                                   "SELECT ID, Dimension_ID, Code, Name FROM nom_cgdimvalues "
                                   "WHERE IsActive = 1 ORDER BY Name"));
    put("CgStore", emptyKeyed());
    put("CustomFormats", emptyKeyed());
    put("Cities",
        emptyList({field("ID", FieldType::Guid), field("Country_ID", FieldType::Guid),
                   field("NamePrefix", FieldType::Text), field("Name", FieldType::Text),
                   field("NameAndPostalCode", FieldType::Text),
                   field("Municipality", FieldType::Text), field("Region", FieldType::Text),
                   field("PostalCode", FieldType::Text)}));
    put("PayReasons", emptyKeyed());
}

void getNomContragentsDetails(OperationContext& ctx) {
    ctx.require(kScreen, rights::OpenDetails);
    answerPartner(ctx, ctx.text("ID"));
    if (ctx.flag("Referentials")) answerReferentials(ctx);
}

// --- Saving -------------------------------------------------------------------

bool hasPending(Recordset& rs) {
    rs.setFilter(FilterGroup::Pending);
    bool any = rs.recordCount() > 0;
    rs.clearFilter();
    return any;
}

// Empty codes are kept as Null, so that any number of rows may lack one.
void nullBlankCodes(Recordset& rs) {
    if (rs.fieldIndex("Code") < 0) return;
    rs.setFilter(FilterGroup::Pending);
    if (rs.recordCount() > 0) {
        for (rs.moveFirst(); !rs.eof(); rs.moveNext()) {
            if (rs.status() == RowStatus::Deleted) continue;
            Variant v = rs.value("Code");
            if (!v.isNull() && isBlank(v)) {
                rs.setValue("Code", Variant::null());
                rs.update();
            }
        }
    }
    rs.clearFilter();
}

// The next free number among the partners' numeric codes.
std::string nextCode(Database& db) {
    auto st = db.prepare(
        "SELECT COALESCE(MAX(CAST(Code AS INTEGER)), 0) + 1 FROM nom_contragents "
        "WHERE Code <> '' AND Code NOT GLOB '*[^0-9]*' AND length(Code) <= 18");
    st->step();
    return std::to_string(st->int64(0));
}

// Another partner holding the same identification or VAT number.
void checkDuplicates(OperationContext& ctx, Recordset& head, const std::string& id) {
    auto other = [&](const char* column, const std::string& value) -> std::optional<std::string> {
        auto st = ctx.db.prepare(std::string("SELECT Name FROM nom_contragents WHERE ID IS NOT ?1 "
                                             "AND upper(trim(") +
                                 column + ")) = upper(?2) ORDER BY Name LIMIT 1");
        st->bindText(1, id);
        st->bindText(2, value);
        if (!st->step()) return std::nullopt;
        return std::string(st->text(0));
    };
    // Placeholders carry no number: only nines, or letters alone ("BG").
    const std::string bulstat = trimmed(head.value("Bulstat"));
    if (!bulstat.empty() && bulstat.find_first_not_of('9') != std::string::npos) {
        if (auto name = other("Bulstat", bulstat))
            throw Refusal(kDuplicateBulstat).with("BllContragent", Variant(*name));
    }
    const std::string taxNo = trimmed(head.value("TaxNo"));
    if (taxNo.find_first_of("0123456789") != std::string::npos) {
        if (auto name = other("TaxNo", taxNo))
            throw Refusal(kDuplicateTaxNo).with("BllContragent", Variant(*name));
    }
}

std::string partnerName(Database& db, const std::string& id) {
    auto st = db.prepare("SELECT Name FROM nom_contragents WHERE ID = ?1");
    st->bindText(1, id);
    return st->step() ? std::string(st->text(0)) : std::string();
}

// A duplicate in a sub-list told by its owner: the row that holds the value
// already, and the partner it belongs to.
Refusal ownedDuplicate(OperationContext& ctx, const SubList& s, const Refusal& r, Recordset& rows) {
    const std::string table = s.table;
    auto find = [&](const std::string& sql, const std::vector<Variant>& params)
        -> std::optional<std::pair<std::string, std::string>> {
        auto st = ctx.db.prepare(sql);
        for (size_t i = 0; i < params.size(); ++i)
            st->bind(static_cast<int>(i + 1), params[i]);
        if (!st->step()) return std::nullopt;
        return std::pair{std::string(st->text(0)), std::string(st->text(1))};
    };
    std::string rowId;
    for (const auto& [name, value] : r.properties())
        if (name == "BllRowID") rowId = value.toString();
    Refusal out(bllerr::DuplicateCode);
    for (const auto& p : r.properties())
        out.with(p.first, p.second);
    if (table == "nom_cgpersons" && r.code() == bllerr::DuplicateCode) {
        if (auto hit = find("SELECT ID, Name FROM nom_cgpersons WHERE Code = ?1 LIMIT 1",
                            {Variant(rowId)})) {
            auto st = ctx.db.prepare("SELECT Cg_ID FROM nom_cgpersons WHERE ID = ?1");
            st->bindText(1, hit->first);
            st->step();
            out.with("BllPrs_ID", Variant(hit->first))
                .with("BllPerson", Variant(hit->second))
                .with("BllContragent", Variant(partnerName(ctx.db, std::string(st->text(0)))));
            return out;
        }
    }
    if (table == "nom_cgdepartments" && r.code() == bllerr::DuplicateCode) {
        if (auto hit = find("SELECT ID, Name FROM nom_cgdepartments WHERE Code = ?1 LIMIT 1",
                            {Variant(rowId)})) {
            auto st = ctx.db.prepare("SELECT Cg_ID FROM nom_cgdepartments WHERE ID = ?1");
            st->bindText(1, hit->first);
            st->step();
            out.with("BllDep_ID", Variant(hit->first))
                .with("BllDepartment", Variant(hit->second))
                .with("BllContragent", Variant(partnerName(ctx.db, std::string(st->text(0)))));
            return out;
        }
    }
    if (table == "nom_cgbankaccounts" && r.code() == bllerr::DuplicateValues) {
        auto row = rows.clone();
        row->clearFilter();
        std::string quoted;
        for (char c : rowId)
            quoted += c == '\'' ? std::string("''") : std::string(1, c);
        if (!rowId.empty() && row->find("ID = '" + quoted + "'")) {
            if (auto hit =
                    find("SELECT ID, Name FROM nom_cgbankaccounts WHERE AccountCode = ?1 "
                         "AND BankCode IS ?2 AND ID <> ?3 LIMIT 1",
                         {row->value("AccountCode"), row->value("BankCode"), Variant(rowId)})) {
                auto st = ctx.db.prepare("SELECT Cg_ID FROM nom_cgbankaccounts WHERE ID = ?1");
                st->bindText(1, hit->first);
                st->step();
                out.with("BllBankAcc_ID", Variant(hit->first))
                    .with("BllBankAccount", Variant(hit->second))
                    .with("BllContragent", Variant(partnerName(ctx.db, std::string(st->text(0)))));
                return out;
            }
        }
    }
    return r;
}

void updNomContragentsDetails(OperationContext& ctx) {
    Ref<Recordset> head = ctx.recordset("Head");
    if (!head || head->recordCount() == 0)
        raise(errc::InvalidProcedureCall, "UpdNomContragentsDetails needs a Head row", "Bll");
    head->moveFirst();
    const bool isNew = head->status() == RowStatus::New;
    ctx.require(kScreen, isNew ? rights::Create : rights::Edit);

    std::string id = isBlank(head->value("ID")) ? std::string() : head->value("ID").toString();
    if (isNew && id.empty()) {
        id = newGuidString();
        head->setValue("ID", Variant(id));
        head->update();
    }
    if (head->fieldIndex("Code") >= 0 && isBlank(head->value("Code"))) {
        head->setValue("Code", Variant(nextCode(ctx.db)));
        head->update();
    }
    // A repeated call after the user agreed to a duplicate skips the checks.
    const Variant check = ctx.request.readProperty("CheckBulstat");
    if (check.isEmpty() || check.isNull() || check.toBool()) checkDuplicates(ctx, *head, id);

    TableWrite headSpec;
    headSpec.table = kTable;
    headSpec.audit = true;
    headSpec.checkLastChange = true;

    bool subChanged = false;
    for (const SubList& s : kSubLists)
        if (s.table)
            if (auto rows = ctx.recordset(s.property)) subChanged = subChanged || hasPending(*rows);

    if (head->status() != RowStatus::Unmodified) {
        try {
            writeRows(ctx, *head, headSpec);
        } catch (Refusal& r) {
            if (r.code() == bllerr::DuplicateCode || r.code() == bllerr::DuplicateName) {
                auto st = ctx.db.prepare(r.code() == bllerr::DuplicateCode
                                             ? "SELECT Name FROM nom_contragents WHERE Code = ?1"
                                             : "SELECT Name FROM nom_contragents WHERE Name = ?1");
                head->moveFirst();
                st->bind(1, head->value(r.code() == bllerr::DuplicateCode ? "Code" : "Name"));
                if (st->step()) r.with("BllContragent", Variant(std::string(st->text(0))));
            }
            throw;
        }
    } else if (subChanged) {
        touchRow(ctx, *head, headSpec);
    }

    for (const SubList& s : kSubLists) {
        if (!s.table) continue;
        Ref<Recordset> rows = ctx.recordset(s.property);
        if (!rows || !hasPending(*rows)) continue;
        nullBlankCodes(*rows);
        TableWrite spec;
        spec.table = s.table;
        spec.audit = s.audit;
        spec.fixed = {{"Cg_ID", Variant(id)}};
        if (rows->fieldIndex("Code") >= 0) spec.rowIdField = "Code";
        try {
            writeRows(ctx, *rows, spec);
        } catch (const Refusal& r) {
            throw ownedDuplicate(ctx, s, r, *rows);
        }
    }

    ctx.response.writeProperty("ID", Variant(id));
    answerPartner(ctx, id);
    // "NeedList" names the lists to refresh, joined by "|".
    const std::string need = "|" + ctx.text("NeedList") + "|";
    if (need.find(std::string("|") + kScreen + "|") != std::string::npos)
        ctx.response.writeProperty("ListResult", Variant(readPartners(ctx.db, {}, id)));
}

void delNomContragents(OperationContext& ctx) {
    ctx.require(kScreen, rights::Delete);
    deleteByKeys(ctx, kTable, "ID");
}

}  // namespace

void registerPartnerOperations(OperationRegistry& r) {
    r.add("GetNomContragents", &getNomContragents, false);
    r.add("GetNomContragentsDetails", &getNomContragentsDetails, false);
    r.add("UpdNomContragentsDetails", &updNomContragentsDetails, true);
    r.add("DelNomContragents", &delNomContragents, true);
}

}  // namespace pelta::bll
