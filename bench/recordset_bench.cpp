// Recordset speed on a million item-like rows, each figure beside a reference
// measured in the same run: the same filter in an in-memory SQLite table, and
// memcpy of the same number of bytes for save and load. The resident memory
// of the recordset is reported in the context.
#include <benchmark/benchmark.h>
#include <sqlite3.h>

#include <unistd.h>
#include <chrono>
#include <cstdio>
#include <cstring>
#include <fstream>
#include <random>
#include <string>

#include "platform/automation/guid.h"
#include "platform/data/recordset.h"

using namespace pelta;

namespace {

constexpr int kRows = 1'000'000;
constexpr const char* kCriteria = "Name LIKE '*abc*' AND IsActive = True";
constexpr const char* kSql = "SELECT rowid FROM items WHERE name LIKE '%abc%' AND is_active = 1";

struct Item {
    Guid id;
    std::string code, name, measure, barcode, note;
    int64_t price;  // scaled by 10,000
    bool active;
    double date, qty;
};

// Deterministic item-like rows: half the names Latin in mixed case, half
// Cyrillic; "abc" turns up by chance in a fraction of the Latin ones.
class Generator {
public:
    Item next(int i) {
        Item it;
        for (auto& b : it.id.bytes)
            b = static_cast<uint8_t>(rng_());
        char code[16];
        std::snprintf(code, sizeof code, "C%07d", i);
        it.code = code;
        it.name = rng_() % 2 ? latinName() : cyrillicName();
        static const char* measures[] = {"бр.", "кг", "л", "м", "пак."};
        it.measure = measures[rng_() % 5];
        it.barcode = std::to_string(3800000000000ULL + rng_() % 100000000000ULL);
        it.note = rng_() % 4 ? std::string() : "Бележка " + std::to_string(rng_() % 1000);
        it.price = static_cast<int64_t>(rng_() % 100000000);
        it.active = rng_() % 10 != 0;
        it.date = 43000 + rng_() % 3000;
        it.qty = static_cast<double>(rng_() % 100000) / 100.0;
        return it;
    }

private:
    std::string latinName() {
        std::string s;
        int words = 2 + static_cast<int>(rng_() % 3);
        for (int w = 0; w < words; ++w) {
            if (w) s.push_back(' ');
            int len = 3 + static_cast<int>(rng_() % 6);
            for (int k = 0; k < len; ++k) {
                char c = static_cast<char>('a' + rng_() % 26);
                if (rng_() % 5 == 0) c = static_cast<char>(c - 32);
                s.push_back(c);
            }
        }
        return s;
    }
    std::string cyrillicName() {
        static const char* words[] = {
            "Мляко", "прясно", "Хляб", "бял",           "Сирене", "краве",  "Кафе", "мляно",
            "Захар", "кафява", "Олио", "слънчогледово", "Бира",   "светла", "Вода", "минерална"};
        std::string s = words[rng_() % 16];
        s += ' ';
        s += words[rng_() % 16];
        s += ' ';
        s += std::to_string(rng_() % 1000);
        return s;
    }
    std::mt19937_64 rng_{20240601};
};

double rssMb() {
    std::ifstream f("/proc/self/statm");
    long pages = 0, resident = 0;
    f >> pages >> resident;
    return static_cast<double>(resident) * static_cast<double>(sysconf(_SC_PAGESIZE)) / 1048576.0;
}

struct Data {
    Ref<Recordset> rs;
    sqlite3* db = nullptr;
    sqlite3_stmt* query = nullptr;
    Bytes saved;
};

Data& data() {
    static Data d = [] {
        Data d;
        const double before = rssMb();
        auto rs = makeRef<Recordset>();
        rs->appendField("ID", FieldType::Guid, 0, false);
        rs->appendField("Code", FieldType::Text, 20);
        rs->appendField("Name", FieldType::Text, 100);
        rs->appendDecimalField("Price", 19, 4);
        rs->appendField("IsActive", FieldType::Boolean);
        rs->appendField("Measure", FieldType::Text, 10);
        rs->appendField("Barcode", FieldType::Text, 20);
        rs->appendField("CD", FieldType::Date);
        rs->appendField("Qty", FieldType::Double);
        rs->appendField("Note", FieldType::Text, 255);
        rs->open();
        {
            Generator g;
            for (int i = 0; i < kRows; ++i) {
                Item it = g.next(i);
                rs->addNew();
                rs->setValue(size_t{0}, it.id.toString());
                rs->setValue(size_t{1}, it.code);
                rs->setValue(size_t{2}, it.name);
                rs->setValue(size_t{3}, Variant(Currency{it.price}));
                rs->setValue(size_t{4}, it.active);
                rs->setValue(size_t{5}, it.measure);
                rs->setValue(size_t{6}, it.barcode);
                rs->setValue(size_t{7}, Date{it.date});
                rs->setValue(size_t{8}, it.qty);
                rs->setValue(size_t{9}, it.note.empty() ? Variant::null() : Variant(it.note));
            }
            rs->update();
            rs->updateBatch();
        }
        const double after = rssMb();
        // The same rows again from the same seed into SQLite.
        sqlite3_open(":memory:", &d.db);
        sqlite3_exec(d.db,
                     "CREATE TABLE items(id BLOB, code TEXT, name TEXT, price INTEGER, "
                     "is_active INTEGER, measure TEXT, barcode TEXT, cd REAL, qty REAL, note TEXT);"
                     "BEGIN",
                     nullptr, nullptr, nullptr);
        sqlite3_stmt* ins = nullptr;
        sqlite3_prepare_v2(d.db, "INSERT INTO items VALUES(?,?,?,?,?,?,?,?,?,?)", -1, &ins,
                           nullptr);
        Generator g;
        for (int i = 0; i < kRows; ++i) {
            const Item b = g.next(i);
            sqlite3_bind_blob(ins, 1, b.id.bytes.data(), 16, SQLITE_STATIC);
            sqlite3_bind_text(ins, 2, b.code.data(), int(b.code.size()), SQLITE_STATIC);
            sqlite3_bind_text(ins, 3, b.name.data(), int(b.name.size()), SQLITE_STATIC);
            sqlite3_bind_int64(ins, 4, b.price);
            sqlite3_bind_int(ins, 5, b.active ? 1 : 0);
            sqlite3_bind_text(ins, 6, b.measure.data(), int(b.measure.size()), SQLITE_STATIC);
            sqlite3_bind_text(ins, 7, b.barcode.data(), int(b.barcode.size()), SQLITE_STATIC);
            sqlite3_bind_double(ins, 8, b.date);
            sqlite3_bind_double(ins, 9, b.qty);
            if (b.note.empty())
                sqlite3_bind_null(ins, 10);
            else
                sqlite3_bind_text(ins, 10, b.note.data(), int(b.note.size()), SQLITE_STATIC);
            sqlite3_step(ins);
            sqlite3_reset(ins);
        }
        sqlite3_finalize(ins);
        sqlite3_exec(d.db, "COMMIT", nullptr, nullptr, nullptr);
        sqlite3_prepare_v2(d.db, kSql, -1, &d.query, nullptr);
        d.rs = rs;
        d.saved = rs->save();
        benchmark::AddCustomContext("rows", std::to_string(kRows));
        benchmark::AddCustomContext(
            "rss_mb_after_building_the_recordset",
            std::to_string(static_cast<int>(after)) +
                " (before building: " + std::to_string(static_cast<int>(before)) + ")");
        benchmark::AddCustomContext("saved_bytes", std::to_string(d.saved.size()));
        return d;
    }();
    return d;
}

std::vector<int64_t> sqliteMatches(Data& d) {
    std::vector<int64_t> ids;
    sqlite3_reset(d.query);
    while (sqlite3_step(d.query) == SQLITE_ROW)
        ids.push_back(sqlite3_column_int64(d.query, 0));
    return ids;
}

void BM_FilterLikeAnd(benchmark::State& st) {
    Data& d = data();
    for (auto _ : st) {
        d.rs->setFilter(kCriteria);
        benchmark::DoNotOptimize(d.rs->recordCount());
    }
    st.counters["matches"] = static_cast<double>(d.rs->recordCount());
    d.rs->clearFilter();
}

void BM_SqliteLikeAnd(benchmark::State& st) {
    Data& d = data();
    size_t n = 0;
    for (auto _ : st)
        n = sqliteMatches(d).size();
    st.counters["matches"] = static_cast<double>(n);
}

// Both in alternation, so that the ratio compares like with like.
void BM_FilterToSqliteRatio(benchmark::State& st) {
    Data& d = data();
    using Clock = std::chrono::steady_clock;
    double ours = 0, theirs = 0;
    for (auto _ : st) {
        auto t0 = Clock::now();
        d.rs->setFilter(kCriteria);
        benchmark::DoNotOptimize(d.rs->recordCount());
        auto t1 = Clock::now();
        benchmark::DoNotOptimize(sqliteMatches(d).size());
        auto t2 = Clock::now();
        ours += std::chrono::duration<double, std::milli>(t1 - t0).count();
        theirs += std::chrono::duration<double, std::milli>(t2 - t1).count();
    }
    d.rs->clearFilter();
    const double n = static_cast<double>(st.iterations());
    st.counters["recordset_ms"] = ours / n;
    st.counters["sqlite_ms"] = theirs / n;
    st.counters["ratio"] = ours / theirs;
}

void BM_FindByCode(benchmark::State& st) {
    Data& d = data();
    int i = 0;
    for (auto _ : st) {
        char crit[40];
        std::snprintf(crit, sizeof crit, "Code = 'c%07d'", (i++ * 7919 + 500000) % kRows);
        d.rs->moveFirst();
        if (!d.rs->find(crit)) st.SkipWithError("not found");
    }
}

void BM_SqliteFindByCode(benchmark::State& st) {
    Data& d = data();
    sqlite3_stmt* q = nullptr;
    sqlite3_prepare_v2(d.db, "SELECT rowid FROM items WHERE code = ? LIMIT 1", -1, &q, nullptr);
    int i = 0;
    for (auto _ : st) {
        char code[16];
        std::snprintf(code, sizeof code, "C%07d", (i++ * 7919 + 500000) % kRows);
        sqlite3_bind_text(q, 1, code, -1, SQLITE_TRANSIENT);
        if (sqlite3_step(q) != SQLITE_ROW) st.SkipWithError("not found");
        sqlite3_reset(q);
    }
    sqlite3_finalize(q);
}

void BM_SortByName(benchmark::State& st) {
    Data& d = data();
    for (auto _ : st) {
        d.rs->setSort("Name ASC");
        st.PauseTiming();
        d.rs->setSort("");
        st.ResumeTiming();
    }
}

void BM_SqliteSortByName(benchmark::State& st) {
    Data& d = data();
    sqlite3_stmt* q = nullptr;
    sqlite3_prepare_v2(d.db, "SELECT rowid FROM items ORDER BY name", -1, &q, nullptr);
    for (auto _ : st) {
        std::vector<int64_t> ids;
        ids.reserve(kRows);
        while (sqlite3_step(q) == SQLITE_ROW)
            ids.push_back(sqlite3_column_int64(q, 0));
        sqlite3_reset(q);
        benchmark::DoNotOptimize(ids.data());
    }
    sqlite3_finalize(q);
    st.SetLabel("binary order, not a collation");
}

void BM_Save(benchmark::State& st) {
    Data& d = data();
    for (auto _ : st) {
        Bytes b = d.rs->save();
        benchmark::DoNotOptimize(b.data());
    }
    st.SetBytesProcessed(static_cast<int64_t>(st.iterations() * d.saved.size()));
}

void BM_Load(benchmark::State& st) {
    Data& d = data();
    for (auto _ : st) {
        auto rs = Recordset::load(d.saved);
        benchmark::DoNotOptimize(rs.get());
    }
    st.SetBytesProcessed(static_cast<int64_t>(st.iterations() * d.saved.size()));
}

// memcpy of the same bytes into a buffer already in memory...
void BM_MemcpyWarm(benchmark::State& st) {
    Data& d = data();
    Bytes dst(d.saved.size());
    for (auto _ : st) {
        std::memcpy(dst.data(), d.saved.data(), d.saved.size());
        benchmark::ClobberMemory();
    }
    st.SetBytesProcessed(static_cast<int64_t>(st.iterations() * d.saved.size()));
}

// ... and into a freshly allocated one, as save and load must do.
void BM_MemcpyFresh(benchmark::State& st) {
    Data& d = data();
    for (auto _ : st) {
        Bytes dst;
        dst.reserve(d.saved.size());
        dst.insert(dst.end(), d.saved.begin(), d.saved.end());
        benchmark::DoNotOptimize(dst.data());
    }
    st.SetBytesProcessed(static_cast<int64_t>(st.iterations() * d.saved.size()));
}

}  // namespace

BENCHMARK(BM_FilterLikeAnd)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_SqliteLikeAnd)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_FilterToSqliteRatio)->Unit(benchmark::kMillisecond)->Iterations(10);
BENCHMARK(BM_FindByCode)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_SqliteFindByCode)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_SortByName)->Unit(benchmark::kMillisecond)->Iterations(3);
BENCHMARK(BM_SqliteSortByName)->Unit(benchmark::kMillisecond)->Iterations(3);
BENCHMARK(BM_Save)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_Load)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_MemcpyWarm)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_MemcpyFresh)->Unit(benchmark::kMillisecond);

int main(int argc, char** argv) {
    benchmark::Initialize(&argc, argv);
    data();  // build once, before timing, so the context carries the memory figures
    benchmark::RunSpecifiedBenchmarks();
    benchmark::Shutdown();
    return 0;
}
