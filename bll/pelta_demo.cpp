// pelta-demo: creates a demo database file.
//   pelta-demo FILE [--banks N] [--days N] [--currencies N] [--partners N] [--items N]
//              [--generated-prices 0|1] [--seed N]
#include <cstdlib>
#include <cstring>
#include <iostream>
#include <string>

#include "bll/service.h"
#include "platform/automation/error.h"

namespace {

int usage() {
    std::cerr << "usage: pelta-demo FILE [--banks N] [--days N] [--currencies N] [--partners N] "
                 "[--items N] [--generated-prices 0|1] [--seed N]\n";
    return 2;
}

bool number(const char* text, long long& out) {
    char* end = nullptr;
    out = std::strtoll(text, &end, 10);
    return end && *end == '\0' && end != text && out >= 0;
}

}  // namespace

int main(int argc, char** argv) {
    if (argc < 2 || argv[1][0] == '-') return usage();
    pelta::bll::DemoOptions o;
    for (int i = 2; i < argc; i += 2) {
        long long v = 0;
        if (i + 1 >= argc || !number(argv[i + 1], v) || v > 100000000) return usage();
        if (std::strcmp(argv[i], "--banks") == 0)
            o.banks = static_cast<int>(v);
        else if (std::strcmp(argv[i], "--days") == 0)
            o.rateDays = static_cast<int>(v);
        else if (std::strcmp(argv[i], "--currencies") == 0)
            o.currenciesPerRate = static_cast<int>(v);
        else if (std::strcmp(argv[i], "--partners") == 0)
            o.partners = static_cast<int>(v);
        else if (std::strcmp(argv[i], "--items") == 0 && v <= 1000000)
            o.items = static_cast<int>(v);
        else if (std::strcmp(argv[i], "--generated-prices") == 0 && v <= 1)
            o.generatedPrices = v == 1;
        else if (std::strcmp(argv[i], "--seed") == 0)
            o.seed = static_cast<uint64_t>(v);
        else
            return usage();
    }
    try {
        pelta::bll::createDemoDatabase(argv[1], o);
    } catch (const pelta::Error& e) {
        std::cerr << "pelta-demo: " << e.description() << '\n';
        return 1;
    }
    return 0;
}
