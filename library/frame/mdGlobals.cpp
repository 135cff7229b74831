#include "library/frame/mdGlobals.h"

#include <cstdio>

#include "library/contracts/Constants.h"
#include "library/contracts/IZonTerminate.h"
#include "library/frame/mdClassFactory.h"
#include "platform/automation/error.h"

namespace PeltaNom15 {

namespace {

// Stands in for "%" inside arguments while the template is filled.
constexpr std::string_view kPercentStandIn = "\xEE\x86\xB6";  // U+E1B6

constexpr const char* kForceTerminate =
    "Обект ще бъде терминиран, въпреки потребителски отказ или грешка при приключване\r\n\r\n%1";
constexpr int32_t kTerminationCanceled = static_cast<int32_t>(0x80040000);

void replaceAll(std::string& s, std::string_view from, std::string_view to) {
    if (from.empty()) return;
    for (size_t pos = s.find(from); pos != std::string::npos; pos = s.find(from, pos)) {
        s.replace(pos, from.size(), to);
        pos += to.size();
    }
}

bool isHex(char c) {
    return (c >= '0' && c <= '9') || (c >= 'a' && c <= 'f') || (c >= 'A' && c <= 'F');
}

int32_t msgBox(const std::string& text, int32_t style) {
    try {
        if (auto services = FrameworkServices()) return services->MsgBox(text, style, {}, {});
    } catch (...) {
    }
    return 0;
}

void queryWalk(bool& cancel, std::vector<pelta::Variant>& items, bool reverse,
               std::vector<IZonTerminate*>& agreed, bool& stop) {
    const size_t n = items.size();
    for (size_t k = 0; k < n && !stop; ++k) {
        pelta::Variant& item = items[reverse ? n - 1 - k : k];
        if (item.isArray()) {
            queryWalk(cancel, item.array(), true, agreed, stop);
            continue;
        }
        auto* term = pelta::query<IZonTerminate>(item.object());
        if (!term) continue;
        if (cancel) {
            // Termination was abandoned: every object is told so.
            bool c = true;
            term->QueryTerminate(c);
            continue;
        }
        bool c = false;
        term->QueryTerminate(c);
        if (c) {
            cancel = true;
            stop = true;
        } else {
            agreed.push_back(term);
        }
    }
}

void terminateWalk(std::vector<pelta::Variant>& items, bool reverse) {
    const size_t n = items.size();
    for (size_t k = 0; k < n; ++k) {
        pelta::Variant& item = items[reverse ? n - 1 - k : k];
        if (item.isArray()) {
            terminateWalk(item.array(), true);
            item.array().clear();
            continue;
        }
        if (auto* term = pelta::query<IZonTerminate>(item.object())) term->Terminate();
        item = pelta::Variant::nothing();
    }
}

}  // namespace

std::string C2Str(const pelta::Variant& Value) {
    if (Value.isString()) return Value.str();
    try {
        return Value.toString();
    } catch (const pelta::Error&) {
        return {};
    }
}

int32_t C2Lng(const pelta::Variant& Value) {
    try {
        return Value.toLong();
    } catch (const pelta::Error&) {
        return 0;
    }
}

double C2Dbl(const pelta::Variant& Value) {
    try {
        return Value.toDouble();
    } catch (const pelta::Error&) {
        return 0.0;
    }
}

pelta::Date C2Date(const pelta::Variant& Value) {
    try {
        return Value.toDate();
    } catch (const pelta::Error&) {
        return {};
    }
}

bool C2Bool(const pelta::Variant& Value) {
    try {
        return Value.toBool();
    } catch (const pelta::Error&) {
        return false;
    }
}

pelta::ObjectRef C2Obj(const pelta::Variant& Value) {
    if (Value.isObject()) return pelta::ObjectRef(Value.object());
    return {};
}

pelta::Bytes C2Bytes(const pelta::Variant& Value) {
    if (Value.isBytes()) return Value.bytes();
    if (Value.isArray()) {
        pelta::Bytes r;
        try {
            for (const auto& v : Value.array())
                r.push_back(v.toByte());
        } catch (const pelta::Error&) {
            return {};
        }
        return r;
    }
    return {};
}

std::string PrintfArgs(std::string_view Template, std::span<const pelta::Variant> Args) {
    std::string r(Template);
    for (size_t i = Args.size(); i-- > 0;) {
        std::string arg = C2Str(Args[i]);
        replaceAll(arg, "%", kPercentStandIn);
        replaceAll(r, "%" + std::to_string(i + 1), arg);
    }
    replaceAll(r, kPercentStandIn, "%");
    return r;
}

std::string SqlQuote(std::string_view Text) {
    std::string r(Text);
    replaceAll(r, "'", "''");
    return r;
}

bool IsGuid(std::string_view Text) {
    constexpr std::string_view kPattern = "{00000000-0000-0000-0000-000000000000}";
    if (Text.size() != kPattern.size()) return false;
    for (size_t i = 0; i < Text.size(); ++i) {
        if (kPattern[i] == '0' ? !isHex(Text[i]) : Text[i] != kPattern[i]) return false;
    }
    return true;
}

std::string Nz(std::string_view Text, std::string_view Default) {
    return std::string(Text.empty() ? Default : Text);
}

std::string FormatCount(int64_t N) {
    if (N == 0) return {};
    const bool negative = N < 0;
    uint64_t u = negative ? 0 - static_cast<uint64_t>(N) : static_cast<uint64_t>(N);
    std::string digits = std::to_string(u);
    std::string r;
    for (size_t i = 0; i < digits.size(); ++i) {
        if (i > 0 && (digits.size() - i) % 3 == 0) r += ',';
        r += digits[i];
    }
    return negative ? "-" + r : r;
}

std::string FormatTime(pelta::Date T) {
    const pelta::DateParts p = pelta::splitDate(T);
    char buf[16];
    if (p.second == 0)
        std::snprintf(buf, sizeof buf, "%02d:%02d", p.hour, p.minute);
    else
        std::snprintf(buf, sizeof buf, "%02d:%02d:%02d", p.hour, p.minute, p.second);
    return buf;
}

std::string DumpValue(const pelta::Variant& Value) {
    using pelta::VarType;
    switch (Value.type()) {
        case VarType::Empty:
            return "Empty";
        case VarType::Null:
            return "Null";
        case VarType::Missing:
            return "Missing";
        case VarType::String: {
            std::string s = Value.str();
            replaceAll(s, "\"", "\"\"");
            return "\"" + s + "\"";
        }
        case VarType::Bytes: {
            const auto& b = Value.bytes();
            if (b.empty()) return "Array(0 bytes)";
            std::string r = "Array(" + std::to_string(b.size()) + " bytes, ";
            char hex[4];
            for (size_t i = 0; i < b.size(); ++i) {
                std::snprintf(hex, sizeof hex, "%02X", b[i]);
                if (i) r += ' ';
                r += hex;
            }
            return r + ")";
        }
        case VarType::Array: {
            std::string r = "Array(";
            bool first = true;
            for (const auto& v : Value.array()) {
                if (!first) r += ", ";
                first = false;
                r += DumpValue(v);
            }
            return r + ")";
        }
        case VarType::Error:
            return "Error " + std::to_string(Value.errorCode());
        case VarType::Object: {
            pelta::Object* o = Value.object();
            if (!o) return "Nothing";
            const std::string type = o->typeName();
            if (type == "Field") {
                try {
                    return "(Name: " + C2Str(pelta::getProperty(o, "Name")) +
                           ", Value: " + DumpValue(pelta::getProperty(o, "Value")) +
                           ", Type: " + C2Str(pelta::getProperty(o, "Type")) +
                           ", DefinedSize: " + C2Str(pelta::getProperty(o, "DefinedSize")) + ")";
                } catch (...) {
                }
            }
            return "Object(" + type + ")";
        }
        default:
            return C2Str(Value);
    }
}

void QueryTerminateObjects(bool& Cancel, std::vector<pelta::Variant>& Objects) {
    std::vector<IZonTerminate*> agreed;
    bool stop = false;
    const bool abandoned = Cancel;
    queryWalk(Cancel, Objects, false, agreed, stop);
    if (!abandoned && Cancel) {
        for (IZonTerminate* term : agreed) {
            bool c = true;
            term->QueryTerminate(c);
        }
    }
}

void TerminateObjects(std::vector<pelta::Variant>& Objects) {
    terminateWalk(Objects, false);
}

bool TerminateObject(pelta::Object* Object, const std::string& Message) {
    auto* term = pelta::query<IZonTerminate>(Object);
    if (!term) return true;
    pelta::ObjectRef keep(Object);
    bool cancel = false;
    term->QueryTerminate(cancel);
    if (cancel) {
        if (!Message.empty()) {
            msgBox(Message, vbExclamation);
            return false;
        }
        if (msgBox(Printf(kForceTerminate, Object->typeName()), vbExclamation | vbOKCancel) != vbOK)
            pelta::raise(kTerminationCanceled, "Termination canceled");
    }
    term->Terminate();
    return true;
}

}  // namespace PeltaNom15
