// A reader of placeable Windows metafiles for the tests: it walks the
// headers and records, checking every size, and collects what was drawn.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

namespace graphicstest {

struct WmfRecord {
    uint32_t words = 0;  // the record's size
    uint16_t function = 0;
    std::vector<uint16_t> params;
};

struct WmfRect {
    int16_t left, top, right, bottom;
};

struct WmfText {
    int16_t x, y;
    std::string text;
};

struct Wmf {
    std::string error;  // empty when the file is well formed
    int16_t left = 0, top = 0, right = 0, bottom = 0;
    uint16_t inch = 0;
    uint16_t objects = 0;
    uint32_t maxRecord = 0;
    std::vector<WmfRecord> records;
    std::vector<WmfRect> rects;
    std::vector<WmfText> texts;
};

inline uint16_t get16(const std::vector<uint8_t>& b, size_t at) {
    return static_cast<uint16_t>(b[at] | (b[at + 1] << 8));
}
inline uint32_t get32(const std::vector<uint8_t>& b, size_t at) {
    return get16(b, at) | (static_cast<uint32_t>(get16(b, at + 2)) << 16);
}

inline Wmf readWmf(const std::vector<uint8_t>& b) {
    Wmf w;
    auto fail = [&](const std::string& why) {
        w.error = why;
        return w;
    };
    if (b.size() < 40 || b.size() % 2 != 0) return fail("too short or odd");
    if (get32(b, 0) != 0x9AC6CDD7) return fail("no placeable key");
    uint16_t sum = 0;
    for (size_t i = 0; i < 20; i += 2)
        sum ^= get16(b, i);
    if (sum != get16(b, 20)) return fail("wrong header checksum");
    w.left = static_cast<int16_t>(get16(b, 6));
    w.top = static_cast<int16_t>(get16(b, 8));
    w.right = static_cast<int16_t>(get16(b, 10));
    w.bottom = static_cast<int16_t>(get16(b, 12));
    w.inch = get16(b, 14);
    const size_t h = 22;
    if (get16(b, h) != 1 || get16(b, h + 2) != 9 || get16(b, h + 4) != 0x0300)
        return fail("not a version 3 metafile header of 9 words");
    if (get32(b, h + 6) * 2 != b.size() - h) return fail("the header's size is not the file's");
    w.objects = get16(b, h + 10);
    w.maxRecord = get32(b, h + 12);
    uint32_t largest = 0;
    size_t at = h + 18;
    while (at < b.size()) {
        if (b.size() - at < 6) return fail("a record header past the end");
        WmfRecord r;
        r.words = get32(b, at);
        r.function = get16(b, at + 4);
        if (r.words < 3 || r.words * 2 > b.size() - at) return fail("a record size past the end");
        for (size_t p = at + 6; p < at + r.words * 2; p += 2)
            r.params.push_back(get16(b, p));
        largest = std::max(largest, r.words);
        at += r.words * 2;
        const bool eof = r.function == 0;
        w.records.push_back(std::move(r));
        if (eof) break;
    }
    if (w.records.empty() || w.records.back().function != 0 || w.records.back().words != 3)
        return fail("no end-of-file record");
    if (at != b.size()) return fail("bytes after the end-of-file record");
    if (largest != w.maxRecord) return fail("the header's largest record is wrong");
    uint32_t created = 0;
    for (const WmfRecord& r : w.records) {
        const auto& p = r.params;
        switch (r.function) {
            case 0x041B:  // rectangle: bottom, right, top, left
                if (p.size() != 4) return fail("a rectangle of the wrong size");
                w.rects.push_back(WmfRect{static_cast<int16_t>(p[3]), static_cast<int16_t>(p[2]),
                                          static_cast<int16_t>(p[1]), static_cast<int16_t>(p[0])});
                break;
            case 0x0521: {  // text out: length, bytes, y, x
                if (p.empty()) return fail("an empty text record");
                const size_t length = p[0];
                if (p.size() != 1 + (length + 1) / 2 + 2) return fail("a text of the wrong size");
                WmfText t;
                for (size_t i = 0; i < length; ++i)
                    t.text += static_cast<char>(i % 2 ? p[1 + i / 2] >> 8 : p[1 + i / 2] & 0xFF);
                t.y = static_cast<int16_t>(p[p.size() - 2]);
                t.x = static_cast<int16_t>(p[p.size() - 1]);
                w.texts.push_back(std::move(t));
                break;
            }
            case 0x02FA:
            case 0x02FB:
            case 0x02FC:
                ++created;
                break;
            case 0x012D:
            case 0x01F0:
                if (p.size() != 1 || p[0] >= w.objects) return fail("an object index out of range");
                break;
        }
    }
    if (created != w.objects) return fail("the header's object count is wrong");
    return w;
}

}  // namespace graphicstest
