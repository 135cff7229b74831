// A stand-alone driver for fuzz targets built without libFuzzer: replays every
// file of a seed folder, then a bounded number of deterministic mutations of
// those seeds (bit flips, truncations, byte insertions and splices).
//   usage: target SEED_DIR [MUTATIONS]
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <random>
#include <vector>

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size);

namespace {
std::vector<uint8_t> mutate(std::vector<uint8_t> d, std::mt19937& rng,
                            const std::vector<std::vector<uint8_t>>& seeds) {
    int steps = 1 + static_cast<int>(rng() % 4);
    for (int s = 0; s < steps; ++s) {
        switch (rng() % 6) {
            case 0:
                if (!d.empty()) d[rng() % d.size()] ^= static_cast<uint8_t>(1u << (rng() % 8));
                break;
            case 1:
                if (!d.empty()) d.resize(rng() % d.size());
                break;
            case 2:
                d.insert(d.begin() + (d.empty() ? 0 : rng() % d.size()),
                         static_cast<uint8_t>(rng()));
                break;
            case 3:
                if (!d.empty()) d[rng() % d.size()] = static_cast<uint8_t>(rng());
                break;
            case 4:
                if (!d.empty()) d[rng() % d.size()] = (rng() & 1) ? 0xFF : 0x00;
                break;
            case 5: {
                const auto& other = seeds[rng() % seeds.size()];
                if (!other.empty() && !d.empty()) {
                    size_t at = rng() % d.size(), from = rng() % other.size();
                    d.resize(at);
                    d.insert(d.end(), other.begin() + from, other.end());
                }
                break;
            }
        }
    }
    return d;
}
}  // namespace

int main(int argc, char** argv) {
    if (argc < 2) {
        std::fprintf(stderr, "usage: %s SEED_DIR [MUTATIONS]\n", argv[0]);
        return 2;
    }
    std::vector<std::vector<uint8_t>> seeds;
    std::error_code ec;
    for (const auto& e : std::filesystem::directory_iterator(argv[1], ec)) {
        if (!e.is_regular_file()) continue;
        std::ifstream in(e.path(), std::ios::binary);
        seeds.emplace_back(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
    }
    if (seeds.empty()) seeds.emplace_back();
    for (const auto& s : seeds)
        LLVMFuzzerTestOneInput(s.data(), s.size());
    long mutations = argc > 2 ? std::atol(argv[2]) : 10000;
    std::mt19937 rng(12345);
    for (long i = 0; i < mutations; ++i) {
        auto d = mutate(seeds[rng() % seeds.size()], rng, seeds);
        LLVMFuzzerTestOneInput(d.data(), d.size());
    }
    std::printf("%zu seeds, %ld mutations: no crash\n", seeds.size(), mutations);
    return 0;
}
