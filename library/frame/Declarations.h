// One line per control or grid column when a screen declares its layout.
#pragma once

#include <string>

#include "library/contracts/Controls.h"

namespace PeltaNom15 {

inline ControlDecl Control(std::string Name, ControlKind Kind, std::string Caption = {},
                           std::string Field = {}, std::string Group = {}) {
    ControlDecl c;
    c.Name = std::move(Name);
    c.Kind = Kind;
    c.Caption = std::move(Caption);
    c.Field = std::move(Field);
    c.Group = std::move(Group);
    return c;
}

// A column bound to the field of its key.
inline ColumnDecl Bound(std::string Key, std::string Caption, bool Visible = true,
                        std::string Format = {}) {
    ColumnDecl c;
    c.Field = Key;
    c.Key = std::move(Key);
    c.Caption = std::move(Caption);
    c.Visible = Visible;
    c.Format = std::move(Format);
    return c;
}

// A bound column the user edits with `Editor`.
inline ColumnDecl Column(std::string Field, std::string Caption, EditorKind Editor,
                         bool Visible = true, std::string Format = {}) {
    ColumnDecl c = Bound(std::move(Field), std::move(Caption), Visible, std::move(Format));
    c.Editor = Editor;
    return c;
}

// A column the screen fills itself (no field).
inline ColumnDecl Computed(std::string Key, std::string Caption, bool Visible = true,
                           std::string Format = {}) {
    ColumnDecl c = Bound(std::move(Key), std::move(Caption), Visible, std::move(Format));
    c.Field.clear();
    return c;
}

}  // namespace PeltaNom15
