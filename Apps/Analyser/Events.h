#pragma once

namespace analyser {

// A key as the view knows it: a character in lower case, or one of these. Values above all characters.
enum Key : char32_t {
    kKeyEscape = 0x110000,
    kKeyEnter,
    kKeyLeft,
    kKeyRight,
    kKeyUp,
    kKeyDown,
    kKeyHome,
    kKeyEnd,
    kKeyMenu,
    kKeyHelp,
    kKeyFullScreen,
};

struct KeyPress {
    char32_t key = 0;
    bool control = false;
};

enum class Button { Left, Right };

// In pixels of the picture.
struct PointerPress {
    Button button = Button::Left;
    float x = 0.0f, y = 0.0f;
    int clicks = 1;  // 2 for the second of a double click
};

}  // namespace analyser
