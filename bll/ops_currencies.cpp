// Currencies, the banks that publish rates, and the currency rates.
#include "bll/operations.h"
#include "bll/service.h"

namespace pelta::bll {

namespace {

constexpr char kRatiosScreen[] = "ctxRatios";
constexpr char kCurrenciesScreen[] = "ctxCurrencies";
constexpr char kBanksScreen[] = "ctxBanks";
constexpr char kCurrenciesTable[] = "nom_currencies";
constexpr char kBanksTable[] = "nom_banks";

const ListDef kRatiosList{
    "SELECT r.ID, r.Date, r.IsActive, r.Pr_ID, b.Name AS PrName, r.Note, r.CU, r.CD, r.LU, r.LD "
    "FROM nom_currratios r JOIN nom_banks b ON b.ID = r.Pr_ID",
    "r.ID", "r.Date DESC, b.Name"};

const ListDef kCurrenciesList{
    "SELECT c.ID, c.Code, c.Name, c.IsActive, c.Note, c.CU, c.CD, c.LU, c.LD "
    "FROM nom_currencies c",
    "c.ID", "c.Code"};

const ListDef kBanksList{
    "SELECT b.ID, b.Name, b.Description, b.GroupName, b.IsActive, b.CU, b.CD, b.LU, b.LD "
    "FROM nom_banks b",
    "b.ID", "b.Name"};

constexpr const char* kRatioHead =
    "SELECT r.ID, r.Date, r.IsActive, r.Pr_ID, b.Name AS PrName, r.Note, r.NoteRtf, "
    "r.CU, r.CD, r.LU, r.LD "
    "FROM nom_currratios r LEFT JOIN nom_banks b ON b.ID = r.Pr_ID WHERE r.ID = ?1";

constexpr const char* kRatioRows =
    "SELECT d.ID, d.CurrRatio_ID, d.Currency_ID, c.Code AS CurrencyCode, "
    "c.Name AS CurrencyName, d.Units, d.Rate, d.Pr_ID, d.Date "
    "FROM nom_currratiosdetails d JOIN nom_currencies c ON c.ID = d.Currency_ID "
    "WHERE d.CurrRatio_ID = ?1 ORDER BY c.Code";

// The rights a batch of pending rows needs: create, edit, delete.
int32_t rightsForPending(Recordset& rs) {
    int32_t need = 0;
    rs.setFilter(FilterGroup::Pending);
    if (rs.recordCount() > 0) {
        for (rs.moveFirst(); !rs.eof(); rs.moveNext()) {
            switch (rs.status()) {
                case RowStatus::New:
                    need |= rights::Create;
                    break;
                case RowStatus::Modified:
                    need |= rights::Edit;
                    break;
                case RowStatus::Deleted:
                    need |= rights::Delete;
                    break;
                default:
                    break;
            }
        }
    }
    rs.clearFilter();
    return need;
}

bool hasPending(Recordset& rs) {
    rs.setFilter(FilterGroup::Pending);
    bool any = rs.recordCount() > 0;
    rs.clearFilter();
    return any;
}

void answerRatio(OperationContext& ctx, const std::string& id) {
    Variant key[] = {Variant(id)};
    ctx.response.writeProperty("Head", Variant(readRecordset(ctx.db, kRatioHead, key)));
    ctx.response.writeProperty("Rows", Variant(readRecordset(ctx.db, kRatioRows, key)));
}

// --- Currency rates ---

void getNomCurrRatios(OperationContext& ctx) {
    ctx.response.writeProperty("List", Variant(readList(ctx.db, kRatiosList)));
}

void getNomCurrRatiosDetails(OperationContext& ctx) {
    ctx.require(kRatiosScreen, rights::OpenDetails);
    answerRatio(ctx, ctx.text("ID"));
    if (ctx.flag("Referentials")) {
        ctx.response.writeProperty(
            "Currencies",
            Variant(readRecordset(ctx.db,
                                  "SELECT ID, Code, Name, IsActive FROM nom_currencies "
                                  "ORDER BY Code")));
        ctx.response.writeProperty(
            "Banks", Variant(readRecordset(ctx.db,
                                           "SELECT ID, Name, Description, GroupName FROM nom_banks "
                                           "WHERE IsActive = 1 ORDER BY Name")));
    }
}

// After the head moved to another bank or date, its unchanged rows follow; a
// currency the bank already has a rate for on that date is refused.
void followHead(OperationContext& ctx, const std::string& id, const Variant& bank,
                const Variant& date) {
    const ColumnType guid = ColumnType::parse("GUID").value();
    const ColumnType day = ColumnType::parse("DATE").value();
    auto st = ctx.db.prepare(
        "UPDATE nom_currratiosdetails SET Pr_ID = ?1, Date = ?2 "
        "WHERE CurrRatio_ID = ?3 AND (Pr_ID IS NOT ?1 OR Date IS NOT ?2)");
    st->bind(1, bank, guid);
    st->bind(2, date, day);
    st->bind(3, Variant(id), guid);
    try {
        st->step();
    } catch (const DbError& e) {
        if (e.failure() != DbFailure::Unique) throw;
        Refusal r(bllerr::DuplicateValues);
        r.with("BllTable", e.table()).with("BllColumn", std::string("Pr_ID, Date, Currency_ID"));
        r.with("BllSqlError", std::string(e.description()));
        auto q = ctx.db.prepare(
            "SELECT d.Currency_ID FROM nom_currratiosdetails d WHERE d.CurrRatio_ID = ?1 AND "
            "EXISTS (SELECT 1 FROM nom_currratiosdetails o WHERE o.Pr_ID = ?2 AND o.Date = ?3 "
            "AND o.Currency_ID = d.Currency_ID AND o.CurrRatio_ID <> ?1) LIMIT 1");
        q->bind(1, Variant(id), guid);
        q->bind(2, bank, guid);
        q->bind(3, date, day);
        if (q->step()) r.with("BllRowID", std::string(q->text(0)));
        throw r;
    }
}

void updNomCurrRatiosDetails(OperationContext& ctx) {
    Ref<Recordset> head = ctx.recordset("Head");
    if (!head || head->recordCount() == 0)
        raise(errc::InvalidProcedureCall, "UpdNomCurrRatiosDetails needs a Head row", "Bll");
    Ref<Recordset> rows = ctx.recordset("Rows");

    head->moveFirst();
    const bool isNew = head->status() == RowStatus::New;
    const bool headChanged = head->status() != RowStatus::Unmodified;
    const bool rowsChanged = rows && hasPending(*rows);
    ctx.require(kRatiosScreen, isNew ? rights::Create : rights::Edit);

    TableWrite headSpec;
    headSpec.table = "nom_currratios";
    headSpec.audit = true;
    headSpec.checkLastChange = true;

    std::string id;
    if (headChanged) {
        WriteResult w = writeRows(ctx, *head, headSpec);
        if (!w.keys.empty()) id = w.keys.front();
    } else {
        id = head->value("ID").toString();
        if (rowsChanged) touchRow(ctx, *head, headSpec);
    }
    if (id.empty()) raise(errc::InvalidProcedureCall, "The rate record has no key", "Bll");

    head->moveFirst();
    Variant bank = head->value("Pr_ID");
    Variant date = head->value("Date");
    if (rows && rowsChanged) {
        TableWrite rowSpec;
        rowSpec.table = "nom_currratiosdetails";
        rowSpec.rowIdField = "Currency_ID";
        rowSpec.fixed = {{"CurrRatio_ID", Variant(id)}, {"Pr_ID", bank}, {"Date", date}};
        writeRows(ctx, *rows, rowSpec);
    }
    if (headChanged && !isNew) followHead(ctx, id, bank, date);

    ctx.response.writeProperty("ID", Variant(id));
    answerRatio(ctx, id);
    answerListResult(ctx, id);
}

void delNomCurrRatios(OperationContext& ctx) {
    ctx.require(kRatiosScreen, rights::Delete);
    deleteByKeys(ctx, "nom_currratios", "ID");
}

// --- Currencies and banks: flat lists written as a batch ---

template <const ListDef& List, const char* Screen, const char* Table>
struct Flat {
    static void get(OperationContext& ctx) {
        ctx.response.writeProperty("List", Variant(readList(ctx.db, List)));
    }
    // Request "List" with pending rows; response the refreshed "List".
    static void upd(OperationContext& ctx) {
        Ref<Recordset> list = ctx.recordset("List");
        if (!list) raise(errc::InvalidProcedureCall, "A List recordset is expected", "Bll");
        if (int32_t need = rightsForPending(*list)) ctx.require(Screen, need);
        TableWrite spec;
        spec.table = Table;
        spec.audit = true;
        spec.checkLastChange = true;
        writeRows(ctx, *list, spec);
        get(ctx);
    }
    static void del(OperationContext& ctx) {
        ctx.require(Screen, rights::Delete);
        deleteByKeys(ctx, Table, "ID");
    }
};

using Currencies = Flat<kCurrenciesList, kCurrenciesScreen, kCurrenciesTable>;
using Banks = Flat<kBanksList, kBanksScreen, kBanksTable>;

}  // namespace

void registerCurrencyOperations(OperationRegistry& r) {
    r.add("GetNomCurrRatios", &getNomCurrRatios, false);
    r.add("GetNomCurrRatiosDetails", &getNomCurrRatiosDetails, false);
    r.add("UpdNomCurrRatiosDetails", &updNomCurrRatiosDetails, true);
    r.add("DelNomCurrRatios", &delNomCurrRatios, true);

    r.add("GetNomCurrencies", &Currencies::get, false);
    r.add("UpdNomCurrencies", &Currencies::upd, true);
    r.add("DelNomCurrencies", &Currencies::del, true);
    r.add("GetNomBanks", &Banks::get, false);
    r.add("UpdNomBanks", &Banks::upd, true);
    r.add("DelNomBanks", &Banks::del, true);

    registerList(kRatiosScreen, kRatiosList);
    registerList(kCurrenciesScreen, kCurrenciesList);
    registerList(kBanksScreen, kBanksList);
}

}  // namespace pelta::bll
