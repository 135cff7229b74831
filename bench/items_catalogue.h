// The catalogue of a million items the item benchmarks run over: generated
// once into the temporary folder and reused (PELTA_ITEMS_BENCH_DB names
// another file); a file with another number of items is made anew.
#pragma once

#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <string>

#include "bll/database.h"
#include "bll/service.h"
#include "platform/automation/error.h"

namespace benchitems {

constexpr int kItems = 1000000;

inline const std::string& databasePath() {
    static const std::string path = [] {
        const char* given = std::getenv("PELTA_ITEMS_BENCH_DB");
        std::string p =
            given ? given
                  : (std::filesystem::temp_directory_path() / "pelta_items_bench_1m.db").string();
        bool ready = false;
        if (std::filesystem::exists(p)) {
            try {
                auto db = pelta::bll::openDatabase(p);
                auto st = db->prepare("SELECT COUNT(*) FROM nom_items");
                ready = st->step() && st->int64(0) == kItems;
            } catch (const pelta::Error&) {
                ready = false;
            }
            if (!ready)
                for (const char* suffix : {"", "-wal", "-shm"})
                    std::filesystem::remove(p + suffix);
        }
        if (!ready) {
            std::fprintf(stderr, "generating %d items into %s ...\n", kItems, p.c_str());
            using Clock = std::chrono::steady_clock;
            const auto t0 = Clock::now();
            pelta::bll::DemoOptions o;
            o.banks = 1;
            o.rateDays = 2;
            o.currenciesPerRate = 2;
            o.items = kItems;
            pelta::bll::createDemoDatabase(p, o);
            std::fprintf(stderr, "generated in %.1f s\n", std::chrono::duration<double>(Clock::now() - t0).count());
        }
        return p;
    }();
    return path;
}

}  // namespace benchitems
