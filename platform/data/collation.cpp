#include "platform/data/collation.h"

#include <unicode/uchar.h>
#include <unicode/ucol.h>
#include <unicode/ustring.h>
#include <unicode/utf8.h>

#include <vector>

#include "platform/automation/error.h"

namespace pelta {

namespace {

inline UChar32 foldCodePoint(UChar32 c) noexcept {
    if (c >= 0x410 && c <= 0x42F) return c + 0x20;  // А..Я
    if (c >= 0x430 && c <= 0x45F) return c;         // а..я, ѐ..џ
    if (c >= 0x400 && c <= 0x40F) return c + 0x50;  // Ѐ..Џ
    return u_foldCase(c, U_FOLD_CASE_DEFAULT);
}

}  // namespace

void foldCaseAppend(std::string_view in, std::string& out) {
    const auto* s = reinterpret_cast<const uint8_t*>(in.data());
    const int32_t n = static_cast<int32_t>(in.size());
    out.reserve(out.size() + in.size());
    int32_t i = 0;
    while (i < n) {
        uint8_t b = s[i];
        if (b < 0x80) {
            out.push_back(static_cast<char>(b >= 'A' && b <= 'Z' ? b + 32 : b));
            ++i;
            continue;
        }
        int32_t start = i;
        UChar32 c;
        U8_NEXT(s, i, n, c);
        if (c < 0) {
            out.append(in.data() + start, static_cast<size_t>(i - start));
            continue;
        }
        UChar32 f = foldCodePoint(c);
        char buf[4];
        int32_t len = 0;
        U8_APPEND_UNSAFE(buf, len, f);
        out.append(buf, static_cast<size_t>(len));
    }
}

std::string foldCase(std::string_view in) {
    std::string out;
    foldCaseAppend(in, out);
    return out;
}

bool equalsIgnoreCase(std::string_view a, std::string_view b) {
    if (a.size() == b.size()) {
        bool ascii = true;
        for (size_t i = 0; i < a.size(); ++i) {
            uint8_t x = static_cast<uint8_t>(a[i]), y = static_cast<uint8_t>(b[i]);
            if ((x | y) & 0x80) {
                ascii = false;
                break;
            }
            if (x >= 'A' && x <= 'Z') x += 32;
            if (y >= 'A' && y <= 'Z') y += 32;
            if (x != y) return false;
        }
        if (ascii) return true;
    }
    return foldCase(a) == foldCase(b);
}

struct SortKeyMaker::Impl {
    UCollator* coll = nullptr;
    std::vector<UChar> utf16;
};

SortKeyMaker::SortKeyMaker(const char* locale) : impl_(std::make_unique<Impl>()) {
    UErrorCode err = U_ZERO_ERROR;
    impl_->coll = ucol_open(locale, &err);
    if (U_FAILURE(err) || !impl_->coll) {
        err = U_ZERO_ERROR;
        impl_->coll = ucol_open("", &err);
    }
    if (U_FAILURE(err) || !impl_->coll)
        raise(errc::Fail, "Cannot open the text collation", "Recordset");
}

SortKeyMaker::~SortKeyMaker() {
    if (impl_->coll) ucol_close(impl_->coll);
}

void SortKeyMaker::append(std::string_view text, std::string& out) {
    auto& buf = impl_->utf16;
    if (buf.size() < text.size() + 1) buf.resize(text.size() + 1);
    UErrorCode err = U_ZERO_ERROR;
    int32_t len16 = 0;
    u_strFromUTF8WithSub(buf.data(), static_cast<int32_t>(buf.size()), &len16, text.data(),
                         static_cast<int32_t>(text.size()), 0xFFFD, nullptr, &err);
    if (U_FAILURE(err)) len16 = 0;
    size_t at = out.size();
    size_t room = text.size() * 4 + 32;
    for (;;) {
        out.resize(at + room);
        int32_t need = ucol_getSortKey(impl_->coll, buf.data(), len16,
                                       reinterpret_cast<uint8_t*>(out.data() + at),
                                       static_cast<int32_t>(room));
        if (need <= 0) {
            out.resize(at);
            return;
        }
        if (static_cast<size_t>(need) <= room) {
            out.resize(at + static_cast<size_t>(need) - 1);  // drop the terminating zero
            return;
        }
        room = static_cast<size_t>(need);
    }
}

}  // namespace pelta
