#pragma once

#include <optional>
#include <string>
#include <vector>

#include "Drawing/DrawTarget.h"
#include "Events.h"

namespace analyser {

struct MenuEntry {
    std::string text;
    std::string shortcut;  // shown at the right
    int command = 0;
    bool checked = false;
};

struct MenuGroup {
    std::string text;
    std::vector<MenuEntry> entries;
};

// A pop-up menu of groups that open beside it, drawn into the picture. Every row has a key of its own, shown
// before its text: the digits and then the letters, so that each entry is two keys away.
class Menu {
public:
    // At a place of the picture; it moves to stay inside.
    void Open(std::vector<MenuGroup> groups, Corvo::PointF place);
    void Close();
    bool IsOpen() const { return m_open; }

    // Both are to be given to an open menu only; what they return was chosen, and the menu is closed.
    std::optional<int> Press(Corvo::PointF place);
    std::optional<int> KeyDown(const KeyPress& press);
    void PointTo(Corvo::PointF place);

    void Draw(Corvo::DrawTarget& target, const Corvo::RectF& bounds);

private:
    struct Level {
        int row = -1;                      // the one that is lit
        std::vector<Corvo::RectF> rows{};  // where they were drawn
        Corvo::RectF box{};
    };

    int RowAt(const Level& level, Corvo::PointF place) const;
    int RowCount(int level) const;
    void OpenGroup(int group, bool lightFirst);
    std::optional<int> Choose(int level, int row);
    void LayOut(Corvo::DrawTarget& target, Level& level, int index, Corvo::PointF corner,
                const Corvo::RectF& bounds);
    void DrawLevel(Corvo::DrawTarget& target, int index) const;
    const std::string& TextOf(int level, int row) const;

    std::vector<MenuGroup> m_groups;
    Corvo::PointF m_place{};
    bool m_open = false;
    int m_group = -1;  // the one that is open
    Level m_levels[2];
};

}  // namespace analyser
