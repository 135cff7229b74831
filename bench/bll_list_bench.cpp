// The shared list reading of the service on a million rows, end to end as a
// screen sees it (request bytes in, response bytes out, response bag opened,
// recordset taken), against the bare SQLite query of the same rows stepping
// every column, measured in the same run.
#include <benchmark/benchmark.h>
#include <sqlite3.h>

#include <unistd.h>
#include <chrono>
#include <cstdio>
#include <filesystem>

#include "bll/database.h"
#include "bll/operations.h"
#include "bll/service.h"
#include "platform/data/propertybag.h"
#include "platform/data/recordset.h"

namespace {

constexpr int kBanks = 10;
constexpr int kDays = 100000;  // 10 banks x 100,000 days = 1,000,000 rate records
constexpr int64_t kRows = int64_t{kBanks} * kDays;

// The database is built once per process and removed at exit (the path is
// never destroyed, so the exit handler may still read it).
const std::string& databasePath() {
    static const std::string* path = [] {
        auto* p = new std::string((std::filesystem::temp_directory_path() /
                                   ("pelta_bll_bench_" + std::to_string(::getpid()) + ".db"))
                                      .string());
        pelta::bll::DemoOptions o;
        o.banks = kBanks;
        o.rateDays = kDays;
        o.currenciesPerRate = 1;
        pelta::bll::createDemoDatabase(*p, o);
        std::atexit([] {
            for (const char* suffix : {"", "-wal", "-shm"})
                std::filesystem::remove(databasePath() + suffix);
        });
        return p;
    }();
    return *path;
}

double g_serviceSeconds = 0, g_bareSeconds = 0;

template <class F>
void timed(benchmark::State& state, double& perIteration, F&& f) {
    double total = 0;
    int64_t n = 0;
    for (auto _ : state) {
        auto t0 = std::chrono::steady_clock::now();
        f();
        total += std::chrono::duration<double>(std::chrono::steady_clock::now() - t0).count();
        ++n;
    }
    perIteration = n ? total / static_cast<double>(n) : 0;
    state.SetItemsProcessed(n * kRows);
}

void BM_ServiceListThroughBag(benchmark::State& state) {
    auto conn = pelta::bll::Connection::open(databasePath(), "admin");
    timed(state, g_serviceSeconds, [&] {
        pelta::PropertyBag request;
        pelta::Bytes response;
        if (!conn->call("GetNomCurrRatios", request.contents(), response))
            state.SkipWithError("call failed");
        auto bag = pelta::PropertyBag::fromContents(response);
        pelta::Variant list = bag->readProperty("List");
        auto* rs = pelta::query<pelta::Recordset>(list.object());
        if (!rs || rs->recordCount() != kRows) state.SkipWithError("wrong row count");
        benchmark::DoNotOptimize(rs);
    });
}

void BM_ServiceListRecordsetOnly(benchmark::State& state) {
    auto db = pelta::bll::openDatabase(databasePath());
    const pelta::bll::ListDef* list = pelta::bll::findList("ctxRatios");
    double unused = 0;
    timed(state, unused, [&] {
        auto rs = pelta::bll::readList(*db, *list);
        benchmark::DoNotOptimize(rs);
    });
}

// The same statement through the SQLite library, every column of every row
// read by its kind.
void BM_BareSqliteSameQuery(benchmark::State& state) {
    const pelta::bll::ListDef* list = pelta::bll::findList("ctxRatios");
    std::string sql = list->select + " ORDER BY " + list->orderBy;
    sqlite3* db = nullptr;
    sqlite3_open_v2(databasePath().c_str(), &db, SQLITE_OPEN_READONLY, nullptr);
    timed(state, g_bareSeconds, [&] {
        sqlite3_stmt* st = nullptr;
        sqlite3_prepare_v2(db, sql.c_str(), -1, &st, nullptr);
        int64_t rows = 0, sum = 0;
        const int n = sqlite3_column_count(st);
        while (sqlite3_step(st) == SQLITE_ROW) {
            for (int c = 0; c < n; ++c) {
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
        if (rows != kRows) state.SkipWithError("wrong row count");
        benchmark::DoNotOptimize(sum);
    });
    sqlite3_close_v2(db);
}

BENCHMARK(BM_BareSqliteSameQuery)->Unit(benchmark::kMillisecond)->Iterations(3);
BENCHMARK(BM_ServiceListRecordsetOnly)->Unit(benchmark::kMillisecond)->Iterations(3);
BENCHMARK(BM_ServiceListThroughBag)->Unit(benchmark::kMillisecond)->Iterations(3);

}  // namespace

int main(int argc, char** argv) {
    benchmark::Initialize(&argc, argv);
    if (benchmark::ReportUnrecognizedArguments(argc, argv)) return 1;
    databasePath();
    benchmark::RunSpecifiedBenchmarks();
    benchmark::Shutdown();
    if (g_bareSeconds > 0 && g_serviceSeconds > 0)
        std::printf("service list through bag bytes / bare SQLite query: %.2fx\n",
                    g_serviceSeconds / g_bareSeconds);
    return 0;
}
