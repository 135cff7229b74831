// The item editor over a catalogue of a million items: showing one item
// (its head and every list kept with it, read by the service, carried as bag
// bytes and bound to the form) and saving a change of one attribute (the
// whole item written back and its list row read for the list). The reference,
// measured in the same run, is SQLite reading the item's head and the rows of
// every table that holds rows of the item.
//
// The database is the items benchmark's (PELTA_ITEMS_BENCH_DB, else the
// temporary folder's pelta_items_bench_1m.db), generated when missing.
#include <benchmark/benchmark.h>

#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <ctime>
#include <filesystem>
#include <random>

#include "bll/database.h"
#include "bll/service.h"
#include "framework/framework.h"
#include "framework/services.h"
#include "framework/user_agent.h"
#include "items_catalogue.h"
#include "library/frame/mdClassFactory.h"
#include "library/items/frmItemsDetails.h"
#include "platform/data/recordset.h"

namespace {

using benchitems::databasePath;
using benchitems::kItems;

struct Host {
    Host() {
        pelta::fw::registerFramework();
        pelta::fw::services()->setUserAgent(pelta::makeRef<pelta::fw::ScriptedUserAgent>());
        PeltaNom15::ResetFrameworkServices();
        connection = pelta::bll::Connection::open(databasePath(), "admin");
        site = pelta::makeRef<pelta::fw::ClientSite>(connection);
        form = pelta::makeRef<PeltaNom15::frmItemsDetails>();
        if (!form->Init(site.get())) form.reset();
    }
    pelta::Ref<pelta::bll::Connection> connection;
    pelta::Ref<pelta::fw::ClientSite> site;
    pelta::Ref<PeltaNom15::frmItemsDetails> form;
};

Host& host() {
    static Host h;
    return h;
}

// Items picked at random, the same in every run.
const std::vector<std::string>& items() {
    static const std::vector<std::string> ids = [] {
        auto db = pelta::bll::openDatabase(databasePath());
        std::mt19937 rng(11);
        std::vector<std::string> out;
        auto st = db->prepare("SELECT ID FROM nom_items WHERE rowid = ?1");
        while (out.size() < 50) {
            st->reset();
            st->bindInt64(1, 1 + static_cast<int64_t>(rng() % kItems));
            if (st->step()) out.emplace_back(st->text(0));
        }
        return out;
    }();
    return ids;
}

void BM_ShowItem(benchmark::State& state) {
    auto& form = host().form;
    if (!form) {
        state.SkipWithError("the form did not initialise");
        return;
    }
    form->ShowDetail(items().back());  // the reference lists come with the first
    size_t i = 0;
    for (auto _ : state)
        if (!form->ShowDetail(items()[i++ % items().size()])) state.SkipWithError("not shown");
}

void BM_SaveItemAttribute(benchmark::State& state) {
    auto& form = host().form;
    const std::string run = std::to_string(std::time(nullptr));
    size_t i = 0;
    for (auto _ : state) {
        state.PauseTiming();
        form->ShowDetail(items()[i % items().size()]);
        // A value of this run: one the item already holds would save nothing.
        form->Attributes()->UserSetValue(
            "Name2", pelta::Variant("Второ име " + run + "/" + std::to_string(i)));
        ++i;
        state.ResumeTiming();
        if (!form->FormExtender()->SaveDocument()) state.SkipWithError("not saved");
    }
}

// SQLite reading the same item's rows: its head and every table that keeps
// rows of an item.
void BM_BareSqliteItemRows(benchmark::State& state) {
    auto db = pelta::bll::openDatabase(databasePath());
    std::vector<std::string> tables;
    {
        auto st = db->prepare(
            "SELECT m.name FROM sqlite_schema m JOIN pragma_table_info(m.name) c "
            "WHERE m.type = 'table' AND c.name = 'Itm_ID' AND m.name <> 'nom_items'");
        while (st->step())
            tables.emplace_back(st->text(0));
    }
    std::vector<std::unique_ptr<pelta::bll::Statement>> reads;
    reads.push_back(db->prepare("SELECT * FROM nom_items WHERE ID = ?1"));
    for (const auto& t : tables)
        reads.push_back(db->prepare("SELECT * FROM " + t + " WHERE Itm_ID = ?1"));
    size_t i = 0;
    int64_t cells = 0;
    for (auto _ : state) {
        const std::string& id = items()[i++ % items().size()];
        for (auto& st : reads) {
            st->reset();
            st->bindText(1, id);
            while (st->step())
                for (int c = 0; c < st->columnCount(); ++c) {
                    benchmark::DoNotOptimize(st->value(c));
                    ++cells;
                }
        }
    }
    state.counters["tables"] = static_cast<double>(reads.size());
    benchmark::DoNotOptimize(cells);
}

BENCHMARK(BM_BareSqliteItemRows)->Unit(benchmark::kMillisecond)->Iterations(50);
BENCHMARK(BM_ShowItem)->Unit(benchmark::kMillisecond)->Iterations(50);
BENCHMARK(BM_SaveItemAttribute)->Unit(benchmark::kMillisecond)->Iterations(20);

}  // namespace

int main(int argc, char** argv) {
    benchmark::Initialize(&argc, argv);
    if (benchmark::ReportUnrecognizedArguments(argc, argv)) return 1;
    databasePath();
    host();
    items();
    benchmark::RunSpecifiedBenchmarks();
    if (host().form) host().form->Terminate();
    host().form.reset();
    benchmark::Shutdown();
    return 0;
}
