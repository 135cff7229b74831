// The items list over a catalogue of a million items (about two barcodes
// each, one price-list type priced for every item in two currencies and two
// measures, stock in one store, one discount schema), end to end as a host
// opens it: the service reads the rows and sets, they travel as bag bytes,
// the recordsets are opened, the grid is bound and the computed columns of
// the first 100 rows are filled. The reference, measured in the same run, is
// SQLite stepping every column of the same rows.
//
// The database is generated once into the temporary folder and reused
// (PELTA_ITEMS_BENCH_DB names another file).
#include <benchmark/benchmark.h>
#include <sqlite3.h>
#include <sys/resource.h>

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <random>

#include "bll/database.h"
#include "bll/operations.h"
#include "bll/service.h"
#include "framework/extenders.h"
#include "framework/framework.h"
#include "framework/grid_extender.h"
#include "framework/services.h"
#include "framework/user_agent.h"
#include "items_catalogue.h"
#include "library/frame/mdClassFactory.h"
#include "library/items/ctxItems.h"
#include "platform/data/recordset.h"

namespace {

using benchitems::databasePath;
using benchitems::kItems;

using Clock = std::chrono::steady_clock;

double seconds(Clock::time_point since) {
    return std::chrono::duration<double>(Clock::now() - since).count();
}

// The framework and a connection, as the host sets them up once.
struct Host {
    Host() {
        pelta::fw::registerFramework();
        pelta::fw::services()->setUserAgent(pelta::makeRef<pelta::fw::ScriptedUserAgent>());
        PeltaNom15::ResetFrameworkServices();
        connection = pelta::bll::Connection::open(databasePath(), "admin");
        site = pelta::makeRef<pelta::fw::ClientSite>(connection);
    }
    pelta::Ref<pelta::bll::Connection> connection;
    pelta::Ref<pelta::fw::ClientSite> site;
};

Host& host() {
    static Host h;
    return h;
}

const std::vector<std::string>& computedColumns() {
    static const std::vector<std::string> columns = [] {
        std::vector<std::string> out;
        const auto list = pelta::makeRef<PeltaNom15::ctxItems>();
        for (const auto& c : list->Definition().Columns)
            if (c.Field.empty() || c.Field.rfind("Store", 0) == 0 || c.Field == "BasePrice" ||
                c.Field == "BasePriceWithVat" || c.Field == "MeasureCode" ||
                c.Field == "CurrencyCode" || c.Field == "Rate" || c.Field == "Discount")
                out.push_back(c.Key);
        return out;
    }();
    return columns;
}

// Opens the list and fills the computed columns of the first 100 rows.
pelta::Ref<PeltaNom15::ctxItems> openList() {
    auto list = pelta::makeRef<PeltaNom15::ctxItems>();
    if (!list->InitClientSite(host().site.get()) || !list->FormExtender()->Refresh()) return {};
    auto* grid = dynamic_cast<pelta::fw::GridExtender*>(list->GridExtender());
    int64_t filled = 0;
    for (const auto& bookmark : grid->visibleBookmarks(0, 100)) {
        for (const auto& column : computedColumns()) {
            benchmark::DoNotOptimize(grid->cellValue(bookmark, column));
            ++filled;
        }
        benchmark::DoNotOptimize(grid->formatRow(bookmark));
    }
    benchmark::DoNotOptimize(filled);
    return list;
}

void closeList(pelta::Ref<PeltaNom15::ctxItems>& list) {
    if (!list) return;
    bool cancel = false;
    list->QueryTerminate(cancel);
    list->Terminate();
    list.reset();
}

double g_openSeconds = 0, g_bareSeconds = 0;
long g_peakKb = 0;

void BM_OpenItemsList(benchmark::State& state) {
    double total = 0;
    int n = 0;
    for (auto _ : state) {
        const auto t0 = Clock::now();
        auto list = openList();
        total += seconds(t0);
        ++n;
        if (!list || list->GridExtender()->Rows()->recordCount() != kItems)
            state.SkipWithError("the list did not open with every item");
        struct rusage usage {};
        getrusage(RUSAGE_SELF, &usage);
        g_peakKb = std::max(g_peakKb, usage.ru_maxrss);
        closeList(list);
    }
    g_openSeconds = n ? total / n : 0;
    state.counters["peak_MB"] = static_cast<double>(g_peakKb) / 1024.0;
}

// The same statements as the service runs for the list and the sets the
// columns are computed from, every column of every row read by its kind.
void BM_BareSqliteSameRows(benchmark::State& state) {
    sqlite3* db = nullptr;
    sqlite3_open_v2(databasePath().c_str(), &db, SQLITE_OPEN_READONLY, nullptr);
    std::string plType;
    {
        sqlite3_stmt* st = nullptr;
        sqlite3_prepare_v2(db, "SELECT Value FROM sys_settings WHERE Name = 'DefPriceList_ID'", -1,
                           &st, nullptr);
        if (sqlite3_step(st) == SQLITE_ROW)
            plType = reinterpret_cast<const char*>(sqlite3_column_text(st, 0));
        sqlite3_finalize(st);
    }
    const pelta::bll::ListDef* list = pelta::bll::findList("ctxItems");
    const std::string statements[] = {
        list->select + " ORDER BY " + list->orderBy,
        "SELECT im.Itm_ID AS ID, im.Itm_ID, im.Measure_ID, m.Code AS MeasureCode, im.Ratio FROM "
        "nom_itemsmeasures im JOIN nom_measures m ON m.ID = im.Measure_ID ORDER BY im.Itm_ID, "
        "m.Code",
        "SELECT p.Itm_ID, p.Currency_ID, p.Measure_ID, p.BasePrice, p.BasePriceWithVat FROM "
        "nom_prices p WHERE p.PlType_ID = '" +
            plType + "' AND p.Cg_ID IS NULL ORDER BY p.Itm_ID, p.Currency_ID, p.Measure_ID",
        "SELECT s.Itm_ID, SUM(s.Quantity), SUM(s.QuantityReserved), SUM(s.QuantitySecMeasure), "
        "SUM(s.TotalSum), SUM(s.MinQuantity) FROM nom_storesaldo s GROUP BY s.Itm_ID ORDER BY "
        "s.Itm_ID",
    };
    double total = 0;
    int n = 0;
    for (auto _ : state) {
        const auto t0 = Clock::now();
        int64_t rows = 0, sum = 0;
        for (const auto& sql : statements) {
            sqlite3_stmt* st = nullptr;
            sqlite3_prepare_v2(db, sql.c_str(), -1, &st, nullptr);
            const int columns = sqlite3_column_count(st);
            while (sqlite3_step(st) == SQLITE_ROW) {
                for (int c = 0; c < columns; ++c) {
                    switch (sqlite3_column_type(st, c)) {
                        case SQLITE_INTEGER:
                            sum += sqlite3_column_int64(st, c);
                            break;
                        case SQLITE_FLOAT:
                            sum += static_cast<int64_t>(sqlite3_column_double(st, c));
                            break;
                        case SQLITE_TEXT:
                            sum += sqlite3_column_bytes(st, c) + *sqlite3_column_text(st, c);
                            break;
                        default:
                            break;
                    }
                }
                ++rows;
            }
            sqlite3_finalize(st);
        }
        benchmark::DoNotOptimize(sum);
        total += seconds(t0);
        ++n;
        state.counters["rows"] = static_cast<double>(rows);
    }
    g_bareSeconds = n ? total / n : 0;
    sqlite3_close_v2(db);
}

// One list kept open for the searches.
pelta::Ref<PeltaNom15::ctxItems>& openOnce() {
    static pelta::Ref<PeltaNom15::ctxItems> list = openList();
    return list;
}

// Texts for the quick find: codes, barcodes and weight barcodes of items
// picked at random.
std::vector<std::string> searchTexts(int kind, size_t count) {
    auto db = pelta::bll::openDatabase(databasePath());
    std::mt19937 rng(7);
    std::vector<std::string> out;
    while (out.size() < count) {
        const int n = kind == 2 ? 100 * static_cast<int>(1 + rng() % (kItems / 100))
                                : static_cast<int>(1 + rng() % kItems);
        char code[16];
        std::snprintf(code, sizeof code, "%07d", n);
        if (kind == 0) {
            out.push_back(std::string("/") + code);
            continue;
        }
        auto st = db->prepare(
            "SELECT b.BarCode FROM nom_itemsbarcodes b JOIN nom_items i ON i.ID = b.Itm_ID "
            "WHERE i.Code = ?1 ORDER BY b.rowid LIMIT 1");
        st->bindText(1, code);
        if (!st->step()) continue;
        std::string barcode(st->text(0));
        if (kind == 1) {
            out.push_back("//" + barcode);
        } else {
            // A scale label of the template: 1.234 kg and any check digit.
            std::string digits = barcode.substr(0, barcode.find('w'));
            out.push_back("//" + digits + "012347");
        }
    }
    return out;
}

void QuickFind(benchmark::State& state, int kind) {
    auto& list = openOnce();
    if (!list) {
        state.SkipWithError("the list did not open");
        return;
    }
    const auto texts = searchTexts(kind, 200);
    // The indexes are built by the first search after a fetch.
    pelta::Variant warm;
    list->QuickFind(texts.front(), warm);
    std::vector<double> samples;
    size_t i = 0, misses = 0;
    for (auto _ : state) {
        const auto t0 = Clock::now();
        pelta::Variant result;
        if (!list->QuickFind(texts[i++ % texts.size()], result)) ++misses;
        samples.push_back(seconds(t0));
    }
    if (misses) state.SkipWithError("a quick find found nothing");
    std::sort(samples.begin(), samples.end());
    state.counters["median_ms"] = samples.empty() ? 0 : samples[samples.size() / 2] * 1000;
}

void BM_QuickFindCode(benchmark::State& state) {
    QuickFind(state, 0);
}
void BM_QuickFindBarcode(benchmark::State& state) {
    QuickFind(state, 1);
}
void BM_QuickFindWeightBarcode(benchmark::State& state) {
    QuickFind(state, 2);
}

void BM_QuickFilterNameSubstring(benchmark::State& state) {
    auto& list = openOnce();
    auto* filter = list->QuickFilter();
    auto* grid = dynamic_cast<pelta::fw::GridExtender*>(list->GridExtender());
    for (auto _ : state) {
        filter->SetText(802, "кафе екстра 99");
        filter->Apply();
        state.counters["rows"] = static_cast<double>(grid->rowCount());
        state.PauseTiming();
        filter->SetText(802, "");
        filter->Apply();
        state.ResumeTiming();
    }
}

BENCHMARK(BM_BareSqliteSameRows)->Unit(benchmark::kMillisecond)->Iterations(3);
BENCHMARK(BM_OpenItemsList)->Unit(benchmark::kMillisecond)->Iterations(3);
BENCHMARK(BM_QuickFindCode)->Unit(benchmark::kMicrosecond)->Iterations(200);
BENCHMARK(BM_QuickFindBarcode)->Unit(benchmark::kMicrosecond)->Iterations(200);
BENCHMARK(BM_QuickFindWeightBarcode)->Unit(benchmark::kMicrosecond)->Iterations(200);
BENCHMARK(BM_QuickFilterNameSubstring)->Unit(benchmark::kMillisecond)->Iterations(5);

}  // namespace

int main(int argc, char** argv) {
    benchmark::Initialize(&argc, argv);
    if (benchmark::ReportUnrecognizedArguments(argc, argv)) return 1;
    databasePath();
    host();
    benchmark::RunSpecifiedBenchmarks();
    if (g_bareSeconds > 0 && g_openSeconds > 0)
        std::printf("opening the list %.3f s / bare SQLite read of the same rows %.3f s: %.2fx\n",
                    g_openSeconds, g_bareSeconds, g_openSeconds / g_bareSeconds);
    std::printf("peak memory with the list open: %.0f MB\n",
                static_cast<double>(g_peakKb) / 1024.0);
    openOnce().reset();
    benchmark::Shutdown();
    return 0;
}
