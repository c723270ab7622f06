// A dialog described as data: its caption, size, controls and menu. The hosts build their
// windows from it, so ids, captions, initial states and list orders are stated once.
#pragma once

#include <cstdint>

namespace ui {

enum class ControlKind : std::uint8_t {
    Label,     // static text
    GroupBox,  // frame with a caption
    Edit,      // single-line edit box
    MultiEdit, // multi-line edit box
    DropList,  // drop-down list, unsorted
    CheckBox,
    RadioButton,
    PushButton,
};

// Style bits of a control.
enum ControlStyle : std::uint32_t {
    StyleNone = 0,
    StyleHidden = 1u << 0,   // created invisible
    StyleDisabled = 1u << 1, // created disabled
    StyleReadOnly = 1u << 2, // edit that the user cannot change
    StyleHScroll = 1u << 3,
    StyleVScroll = 1u << 4,
    StyleGroupStart = 1u << 5, // first radio button of a group
};

// Controls without an id of their own (labels, group boxes) use kNoControlId.
inline constexpr int kNoControlId = -1;

struct ControlSpec {
    int id;
    ControlKind kind;
    const char* caption; // "" for none
    std::uint32_t style; // ControlStyle bits
    // Geometry in dialog units (a quarter of the font's average width, an eighth of its
    // height), as the template states it.
    short x, y, width, height;
};

struct MenuItemSpec {
    const char* caption; // with '&' marking the access key; nullptr for a separator
    int id;              // 0 for a separator
    bool greyed;
};

struct MenuSpec {
    const char* caption;
    const MenuItemSpec* items;
    int itemCount;
};

struct DialogTemplate {
    int resourceId;
    const char* caption;
    const char* fontName;
    int fontPoints;
    short width, height; // dialog units
    const ControlSpec* controls;
    int controlCount;
    int menuId;
    const MenuSpec* menus;
    int menuCount;

    // The control with the id, or nullptr.
    const ControlSpec* Find(int id) const
    {
        for (int i = 0; i < controlCount; ++i) {
            if (controls[i].id == id)
                return &controls[i];
        }
        return nullptr;
    }
};

} // namespace ui
