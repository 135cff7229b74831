// Text typed by users or read from files reaches the number and date readers:
// any text must convert or raise a pelta::Error, never crash.
#include <cstddef>
#include <cstdint>
#include <string>

#include "platform/automation/error.h"
#include "platform/automation/variant.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    std::string text(reinterpret_cast<const char*>(data), size);
    pelta::Variant v(text);
    auto attempt = [](auto&& f) {
        try {
            f();
        } catch (const pelta::Error&) {
        }
    };
    attempt([&] { (void)v.toDouble(); });
    attempt([&] { (void)v.toLong(); });
    attempt([&] { (void)v.toCurrency(); });
    attempt([&] { (void)v.toBool(); });
    attempt([&] {
        pelta::Decimal d = v.toDecimal();
        // What a decimal writes, it reads back to the same value.
        auto again = pelta::Decimal::parse(d.toString());
        if (!again || !(*again == d)) __builtin_trap();
    });
    attempt([&] {
        pelta::Date d;
        if (pelta::parseDate(text, d)) (void)pelta::formatDate(d, "yyyy.mm.dd hh:nn:ss");
    });
    attempt([&] { (void)pelta::compareValues(v, pelta::Variant(1.5), true); });
    return 0;
}
