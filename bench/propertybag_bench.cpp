// Writing and reading the byte form of a bag of 10,000 text and decimal
// properties, beside a memcpy of the same number of bytes.
#include <benchmark/benchmark.h>

#include <cstring>
#include <string>

#include "platform/data/propertybag.h"

namespace {

using namespace pelta;

constexpr int kProperties = 10000;

const PropertyBag& sampleBag() {
    static const Ref<PropertyBag> bag = [] {
        auto b = makeRef<PropertyBag>();
        for (int i = 0; i < kProperties; ++i) {
            std::string name = "Property" + std::to_string(i);
            if (i % 2 == 0) {
                b->writeProperty(name, Variant("Наименование на артикул " + std::to_string(i)));
            } else {
                b->writeProperty(name, Variant(Decimal::fromParts(1234567 + i, 0, 4, i % 3 == 0)));
            }
        }
        return b;
    }();
    return *bag;
}

void BM_Contents(benchmark::State& state) {
    const PropertyBag& bag = sampleBag();
    size_t bytes = 0;
    for (auto _ : state) {
        Bytes b = bag.contents();
        bytes = b.size();
        benchmark::DoNotOptimize(b.data());
    }
    state.SetBytesProcessed(static_cast<int64_t>(state.iterations() * bytes));
}
BENCHMARK(BM_Contents);

void BM_FromContents(benchmark::State& state) {
    const Bytes bytes = sampleBag().contents();
    for (auto _ : state) {
        auto bag = PropertyBag::fromContents(bytes);
        benchmark::DoNotOptimize(bag.get());
    }
    state.SetBytesProcessed(static_cast<int64_t>(state.iterations() * bytes.size()));
}
BENCHMARK(BM_FromContents);

// The reference: copying the same bytes into a fresh buffer.
void BM_MemcpySameBytes(benchmark::State& state) {
    const Bytes bytes = sampleBag().contents();
    for (auto _ : state) {
        Bytes copy(bytes.size());
        std::memcpy(copy.data(), bytes.data(), bytes.size());
        benchmark::DoNotOptimize(copy.data());
        benchmark::ClobberMemory();
    }
    state.SetBytesProcessed(static_cast<int64_t>(state.iterations() * bytes.size()));
}
BENCHMARK(BM_MemcpySameBytes);

}  // namespace

BENCHMARK_MAIN();
