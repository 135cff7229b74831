// The attribute grid: the further fields of a detail form's head, one row
// each, in numbered groups, with the chosen row's help text under the grid.
// The values live in the current row of the bound head recordset: the grid
// reads them from there and writes what the person enters straight into it,
// converted to the head field's type.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "framework/extender_base.h"
#include "library/contracts/Extenders.h"

namespace pelta::fw {

using PeltaNom15::RecordsetRef;

// A number written with a format of the Format function: the named formats
// "General Number" (plain), "Fixed", "Standard" and "Percent", or a pattern
// of "0", "#", "," and "." with literal text around it ("#,##0.000#####",
// "0.00%"; only the section before a ";" is used). Thousands are separated
// by ",", the decimal point is "."; rounding is half away from zero. A value
// that is not a number (Null, text) is written as its plain text.
std::string formatNumber(const pelta::Variant& value, std::string_view format);

// A number as a person types it: spaces anywhere; "." or "," as the decimal
// separator; when both appear, the one that comes last is the decimal
// separator and the other separates thousands; the same separator several
// times separates thousands. Nullopt when the text is not a number.
std::optional<pelta::Decimal> parseTypedNumber(std::string_view text);

class AttribGridExtender : public PeltaNom15::IAttribGridExtender, public ExtenderBase {
public:
    AttribGridExtender();
    ~AttribGridExtender() override;
    AttribGridExtender(const AttribGridExtender&) = delete;
    AttribGridExtender& operator=(const AttribGridExtender&) = delete;

    PeltaNom15::AttribEvents& Events() override { return events_; }
    // Raises InvalidProcedureCall for groups that are not number and caption
    // pairs, or a number given twice.
    void Init(pelta::Object* Owner, const std::string& GridName,
              const std::string& Groups) override;
    std::string GridName() override { return gridName_; }
    // Also raises for an empty field and for fixed-list values that are not
    // value and text pairs.
    void AddAttribute(const PeltaNom15::AttribDecl& Attribute) override;
    std::vector<PeltaNom15::AttribDecl> Attributes() override;
    // Raises InvalidProcedureCall for a field that is not a list or tree-list
    // attribute, or a field the rows lack; null rows take the list away.
    void SetList(const std::string& Field, RecordsetRef Rows, const std::string& KeyField,
                 const std::string& ShownField, const std::string& ParentField = {}) override;
    void Bind(RecordsetRef Head) override;
    // Empty when nothing is bound, the head has no current row or no such field.
    pelta::Variant Value(const std::string& Field) override;
    // What the person enters, by editor:
    // * entry: into a number field, a number or a text with "." or "," as
    //   decimal separator (see parseTypedNumber; a fraction is refused by a
    //   whole-number field); a date field takes a date or its text; other
    //   fields take the text;
    // * check box: a Boolean (numbers and "True"/"False" convert; Null is False);
    // * list and tree list: a key among the rows of SetList;
    // * fixed list: one of the values of Values;
    // * selector: the key of the picked record.
    // Empty text and Null clear the value (Null), except for a check box.
    // Then BeforeUpdate (may change the value or cancel), the value written
    // into the head's current row (the edit state is set when it changed),
    // and AfterUpdate. False when refused: not convertible, not offered,
    // cancelled, or not accepted by the head field (too long, Null where
    // Null is not allowed); the old value stays.
    // Raises InvalidProcedureCall for an undeclared field, ObjectVariableNotSet
    // when no head with a current row is bound.
    bool UserSetValue(const std::string& Field, const pelta::Variant& Value) override;
    void SetValue(const std::string& Field, const pelta::Variant& Value) override;
    std::string ShownText(const std::string& Field) override;
    // Raises InvalidProcedureCall unless the field is a selector whose
    // ShownField the head has.
    void SetShownText(const std::string& Field, const std::string& Text) override;
    bool EditState() override { return editState_; }
    void ResetEditState() override { editState_ = false; }
    std::string SelectedField() override { return selected_; }
    // Raises InvalidProcedureCall for an undeclared field; SelChange is
    // raised when the chosen row changes.
    void Select(const std::string& Field) override;
    std::string HelpText() override;

    // ---- For hosts and renderers ----------------------------------------------

    struct Group {
        int32_t number = 0;
        std::string caption;
    };
    const std::vector<Group>& groups() const noexcept { return groups_; }
    RecordsetRef head() const { return head_; }

    // A row as drawn: its text and style after RowFormat. A check box gives
    // no text (the host draws the box from Value); a list its row's shown
    // text; a fixed list the text of its value; a selector its ShownField;
    // a number its Format. A value the list does not offer shows as it is.
    struct ShownRow {
        std::string text;
        std::string style;
    };
    ShownRow shownRow(const std::string& field);

    // What a list, tree list or fixed list attribute offers, in order: keys
    // as text, the shown text and, in a tree list, the parent's key (empty
    // at the root).
    struct Choice {
        std::string key;
        std::string text;
        std::string parentKey;
    };
    std::vector<Choice> choices(const std::string& field);

    // The person presses the button of a selector row.
    void buttonClick(const std::string& field);

private:
    struct List {
        RecordsetRef rows;
        std::string keyField;
        std::string shownField;
        std::string parentField;
    };
    struct Attribute {
        PeltaNom15::AttribDecl decl;
        std::vector<std::pair<std::string, std::string>> fixed;  // value, text
        List list;
    };

    Attribute& attribute(const std::string& field, const char* source);
    // The head positioned on its current row; raises when there is none.
    pelta::Recordset& currentHead(const char* source);
    // What the person entered as a value for the head field; nullopt when refused.
    std::optional<pelta::Variant> convert(const Attribute& a, const pelta::Variant& value);
    std::optional<pelta::Variant> fromList(const Attribute& a, const pelta::Variant& value);
    std::optional<pelta::Variant> fromFixedList(const Attribute& a, const pelta::Variant& value);
    std::optional<pelta::Variant> toFieldType(const std::string& field,
                                              const pelta::Variant& value);
    std::string baseText(Attribute& a);

    PeltaNom15::AttribEvents events_;
    std::string gridName_;
    std::vector<Group> groups_;
    std::vector<Attribute> rows_;  // in the order declared
    RecordsetRef head_;
    bool editState_ = false;
    std::string selected_;
};

}  // namespace pelta::fw
