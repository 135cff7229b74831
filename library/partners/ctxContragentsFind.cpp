// The partners' list as a selector, and the row filters built from typed
// text: the quick filter of the grid, the tree's dimension values and the
// selector's quick find.
#include "library/contracts/Constants.h"
#include "library/frame/mdErrorHandling.h"
#include "library/frame/mdFilter.h"
#include "library/frame/mdGlobals.h"
#include "library/partners/ctxContragents.h"
#include "platform/automation/error.h"
#include "platform/data/recordset.h"

namespace PeltaNom15 {

namespace {

constexpr const char* kObjectName = "ctxContragents";
constexpr const char* kCaption = "Контрагенти";

// Fields an address search ("//") looks in, in order.
constexpr const char* kAddressFields[] = {
    "Address", "CountryName", "CityName",   "DeliveryAddress", "CorrespAddress",
    "Phone",   "Fax",         "Email",      "WebAddress",      "Bulstat",
    "TaxNo",   "DvskNo",      "DefMolName", "DefMolEgn",       "ContactName",
    "Note",    "Name2",       "PosCards"};

// Numbers are searched from their start, every other field anywhere.
bool FromStart(std::string_view Field) {
    return Field == "Bulstat" || Field == "TaxNo" || Field == "DvskNo";
}

std::string Join(const std::vector<std::string>& Parts, const char* Separator) {
    std::string out;
    for (const auto& p : Parts)
        if (!p.empty()) out += (out.empty() ? "" : Separator) + p;
    return out;
}

std::vector<std::string> Split(const std::string& Text, char Separator) {
    std::vector<std::string> out;
    size_t from = 0;
    while (from <= Text.size()) {
        size_t at = Text.find(Separator, from);
        if (at == std::string::npos) at = Text.size();
        out.push_back(Text.substr(from, at - from));
        from = at + 1;
    }
    return out;
}

}  // namespace

std::string ctxContragents::pvAddressClause(const std::string& Text) {
    std::vector<std::string> parts;
    for (const char* field : kAddressFields) {
        if (m_rsList && m_rsList->fieldIndex(field) < 0) continue;
        const std::string_view f = field;
        if (f == "PosCards" && Text.size() >= 2 && Text[0] == '*') {
            // "*number": one whole card, between its separators.
            parts.push_back("[PosCards] LIKE '*\x7F" + LikeEscape(Text.substr(1)) + "\x7F*'");
            continue;
        }
        parts.push_back(FilterLike(field, Text, !FromStart(field)));
    }
    return Join(parts, " OR ");
}

std::string ctxContragents::FindClause(const std::string& Text) {
    if (Text.rfind("//", 0) == 0) {
        if (CharCount(Text) < 3) return {};
        return pvAddressClause(Text.substr(2));
    }
    if (Text.rfind("/", 0) == 0) {
        if (Text.size() < 2) return {};
        return FilterLike("Code", Text.substr(1));
    }
    return FilterLike("Name", Text);
}

std::string ctxContragents::GroupClause(const std::string& Values) {
    std::vector<std::string> parts, captions;
    for (std::string value : Split(Values, '\x01')) {
        // A path names its last part.
        if (auto slash = value.rfind('\\'); slash != std::string::npos)
            value = value.substr(slash + 1);
        if (value.empty() || !m_rsDimValues || !m_rsDimensions) continue;
        auto v = m_rsDimValues->clone();
        if (v->recordCount() == 0 || !v->find("Name = " + FilterLiteral(value))) continue;
        auto d = m_rsDimensions->clone();
        if (d->recordCount() == 0 ||
            !d->find("ID = " + FilterLiteral(C2Str(v->value("Dimension_ID")))))
            continue;
        const std::string code = C2Str(d->value("Code"));
        if (code.empty() || !m_rsList || m_rsList->fieldIndex(code) < 0) continue;
        // The column holds the partner's values joined by "; ".
        const std::string e = LikeEscape(value), f = "[" + code + "]";
        parts.push_back("(" + FilterEquals(code, value) + " OR " + f + " LIKE '" + e + "; *' OR " +
                        f + " LIKE '*; " + e + "' OR " + f + " LIKE '*; " + e + "; *')");
        captions.push_back(value + " (" + code + ")");
    }
    m_sGroupCaption = Join(captions, ", ");
    return Join(parts, " OR ");
}

void ctxContragents::m_oQuickFilterExt_FilterClause(int32_t FilterID, const std::string& Text,
                                                    std::string& Clause, bool& Handled) {
    try {
        Handled = true;
        switch (FilterID) {
            case kFilterFind:
                Clause = FindClause(Text);
                break;
            case kFilterGroup:
                Clause = GroupClause(Text);
                break;
            case kFilterType:
                Clause = IsGuid(Text) ? "CgType_ID = " + FilterLiteral(Text) : std::string();
                break;
            default:
                Handled = false;
                break;
        }
    } catch (...) {
        Clause.clear();
        PrintError("m_oQuickFilterExt_FilterClause", kObjectName);
    }
}

// ---- the selector ---------------------------------------------------------------

bool ctxContragents::pvEnsureList() {
    if (!m_oForm) return false;
    if (m_rsList && !m_bRefetch) return true;
    return m_oForm->Refresh() && m_rsList;
}

pelta::Variant ctxContragents::pvSingleRow(const std::string& Criterion) {
    if (Criterion.empty() || !m_rsList) return {};
    auto rows = m_rsList->clone();
    rows->setFilter(Criterion);
    if (rows->recordCount() != 1) return {};
    rows->moveFirst();
    return rows->bookmark();
}

bool ctxContragents::QuickFind(const std::string& Text, pelta::Variant& Result) {
    try {
        Result = pelta::Variant();
        if (Text.empty() || !pvEnsureList()) return false;
        std::vector<std::string> steps;
        if (IsGuid(Text)) {
            steps.push_back("ID = " + FilterLiteral(Text));
        } else if (Text.rfind("//", 0) == 0) {
            if (CharCount(Text) >= 3) steps.push_back(pvAddressClause(Text.substr(2)));
        } else if (Text.rfind("/", 0) == 0) {
            if (CharCount(Text) >= 2) {
                const std::string code = Text.substr(1);
                steps.push_back(FilterEquals("Code", code));
                steps.push_back(FilterLike("Code", code, false));
            }
        } else {
            steps.push_back(FilterEquals("Name", Text));
            steps.push_back(FilterEquals("Code", Text));
            steps.push_back(FilterLike("Code", Text, false));
            steps.push_back(FilterLike("Name", Text));
        }
        for (const auto& step : steps) {
            pelta::Variant row = pvSingleRow(step);
            if (row.isEmpty()) continue;
            m_vChosen = {row};
            m_lNextItem = 0;
            Result = row;
            return true;
        }
        return false;
    } catch (...) {
        ShowError("IZonSelector_QuickFind", kObjectName, kCaption);
        return false;
    }
}

bool ctxContragents::ShowSelect(pelta::Variant& CurrentValue, pelta::Variant& SearchText,
                                pelta::Variant& Result) {
    try {
        Result = pelta::Variant();
        if (!pvEnsureList()) return false;
        const std::string search = C2Str(SearchText);
        pelta::Variant found;
        if (!search.empty() && QuickFind(search, found)) {
            auto row = m_rsList->clone();
            row->setBookmark(found);
            Result = pelta::Variant(C2Str(row->value("ID")));
            return true;
        }
        // The list is shown: filtered by the text, standing on the current value.
        // (A filter applied anew would clear the rows the person marked.) No
        // text at all leaves the list as the person filtered it.
        if (m_oQuickFilterExt && !SearchText.isEmpty() &&
            m_oQuickFilterExt->Text(kFilterFind) != search) {
            m_oQuickFilterExt->SetText(kFilterFind, search);
            m_oQuickFilterExt->Apply();
        }
        const std::string current = C2Str(CurrentValue);
        if (IsGuid(current)) m_oGridExt->MoveToRow("ID = " + FilterLiteral(current));
        // The rows the person marked (else the one the grid stands on) are chosen.
        m_vChosen = m_oGridExt->SelectedBookmarks();
        if (m_vChosen.empty() && m_oGridExt->HasCurrentRow())
            m_vChosen.push_back(m_oGridExt->CurrentBookmark());
        m_lNextItem = 0;
        std::vector<std::string> keys;
        auto row = m_rsList->clone();
        for (const auto& b : m_vChosen) {
            row->setBookmark(b);
            keys.push_back(C2Str(row->value("ID")));
        }
        Result = pelta::Variant(Join(keys, "\x01"));
        return !keys.empty();
    } catch (...) {
        ShowError("IZonSelector_ShowSelect", kObjectName, kCaption);
        return false;
    }
}

bool ctxContragents::GetNextItem(pelta::Variant& ID, pelta::Variant& Name, pelta::Variant& Item) {
    try {
        while (m_rsList && m_lNextItem < m_vChosen.size()) {
            const pelta::Variant bookmark = m_vChosen[m_lNextItem++];
            auto row = m_rsList->clone();
            try {
                row->setBookmark(bookmark);
            } catch (const pelta::Error&) {
                continue;  // the row went with a later fetch
            }
            ID = row->value("ID");
            Name = row->value("Name");
            Item = bookmark;
            return true;
        }
        return false;
    } catch (...) {
        PrintError("IZonSelector_GetNextItem", kObjectName);
        return false;
    }
}

bool ctxContragents::Reset() {
    m_lNextItem = 0;
    return true;
}

bool ctxContragents::InitCgType(const std::string& Types, const std::string& SecondRestriction) {
    if (Types != m_sCgTypes || SecondRestriction != m_sCgTypes2) {
        m_sCgTypes = Types;
        m_sCgTypes2 = SecondRestriction;
        m_bRefetch = true;
    }
    return true;
}

bool ctxContragents::InitDimValue(const std::string& Dimension, const std::string& Value) {
    if (Dimension != m_sDimension || Value != m_sDimValue) {
        m_sDimension = Dimension;
        m_sDimValue = Value;
        m_bRefetch = true;
    }
    return true;
}

bool ctxContragents::InitMedia(const std::string& Media, const std::string& Value) {
    if (Media != m_sMedia || Value != m_sMediaValue) {
        m_sMedia = Media;
        m_sMediaValue = Value;
        m_bRefetch = true;
    }
    return true;
}

}  // namespace PeltaNom15
