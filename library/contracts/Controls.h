// Declarations of a form's controls and of a grid's columns, written once per
// screen, so that the framework holds their values and any host can draw them.
#pragma once

#include <string>
#include <vector>

namespace PeltaNom15 {

enum class ControlKind {
    Label,
    Text,
    Number,
    Date,
    CheckBox,
    Combo,     // a drop-down list over rows
    Selector,  // a field that picks a record through a selector
    Grid,
    Tree,
    TabStrip,
    Splitter,
    Note,  // multi-line plain text
    RichText,
    Button,
    Picture,  // an image; its value is an SVG document (empty: none)
};

struct ControlDecl {
    std::string Name;  // "cboBank"
    ControlKind Kind = ControlKind::Text;
    std::string Caption;  // "Банка"
    std::string Field;    // bound field of the head, may be empty
    std::string Group;    // group or tab the control sits in
    std::string Format;   // number or date format
    std::string Prompt;   // shown in an empty field ("Изберете банка")
    std::string Hint;     // shown beside the field
    bool ReadOnly = false;
};

enum class EditorKind { None, Text, Number, Date, CheckBox, Combo, Selector };

struct ColumnDecl {
    std::string Key;  // column key, usually the field name
    std::string Caption;
    std::string Field;  // bound field; empty for a computed column
    bool Visible = true;
    std::string Format;
    EditorKind Editor = EditorKind::None;
    int32_t Width = 0;  // 0: the host decides
};

}  // namespace PeltaNom15
