#include "Menu.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <string_view>

#include "Drawing/Views/Look.h"

namespace analyser {
namespace {

using Corvo::DrawTarget, Corvo::PointF, Corvo::RectF, Corvo::TextAlign;
namespace Look = Corvo::Look;

constexpr std::string_view kKeys = "123456789abcdefghijklmnopqrstuvwxyz";
constexpr float kRowHeight = 23.0f, kPad = 8.0f, kKeyWidth = 18.0f, kTickWidth = 18.0f;  // in 1/96 inch

std::string_view KeyOf(int row) {
    return row < static_cast<int>(kKeys.size()) ? kKeys.substr(static_cast<std::size_t>(row), 1) : "";
}

}  // namespace

void Menu::Open(std::vector<MenuGroup> groups, PointF place) {
    m_groups = std::move(groups);
    m_place = place;
    m_open = !m_groups.empty();
    m_group = -1;
    m_levels[0] = m_levels[1] = {};
}

void Menu::Close() { m_open = false; }

int Menu::RowCount(int level) const {
    if (level == 0) return static_cast<int>(m_groups.size());
    return m_group < 0 ? 0 : static_cast<int>(m_groups[static_cast<std::size_t>(m_group)].entries.size());
}

const std::string& Menu::TextOf(int level, int row) const {
    const auto index = static_cast<std::size_t>(row);
    return level == 0 ? m_groups[index].text
                      : m_groups[static_cast<std::size_t>(m_group)].entries[index].text;
}

int Menu::RowAt(const Level& level, PointF place) const {
    for (std::size_t i = 0; i < level.rows.size(); ++i)
        if (Contains(level.rows[i], place)) return static_cast<int>(i);
    return -1;
}

void Menu::OpenGroup(int group, bool lightFirst) {
    if (group != m_group) m_levels[1] = {};
    m_group = group;
    m_levels[0].row = group;
    if (lightFirst && m_levels[1].row < 0) m_levels[1].row = 0;
}

std::optional<int> Menu::Choose(int level, int row) {
    if (row < 0 || row >= RowCount(level)) return std::nullopt;
    if (level == 0) {
        OpenGroup(row, true);
        return std::nullopt;
    }
    Close();
    return m_groups[static_cast<std::size_t>(m_group)].entries[static_cast<std::size_t>(row)].command;
}

void Menu::PointTo(PointF place) {
    const int entry = m_group < 0 ? -1 : RowAt(m_levels[1], place);
    if (entry >= 0)
        m_levels[1].row = entry;
    else if (const int row = RowAt(m_levels[0], place); row >= 0)
        OpenGroup(row, false);
}

std::optional<int> Menu::Press(PointF place) {
    if (m_group >= 0 && Contains(m_levels[1].box, place)) return Choose(1, RowAt(m_levels[1], place));
    if (Contains(m_levels[0].box, place))
        Choose(0, RowAt(m_levels[0], place));
    else
        Close();
    return std::nullopt;
}

std::optional<int> Menu::KeyDown(const KeyPress& press) {
    const int level = m_group >= 0 && m_levels[1].row >= 0 ? 1 : 0;
    int& row = m_levels[level].row;
    const int count = RowCount(level);
    switch (press.key) {
        case kKeyDown:
            row = (row + 1) % count;
            if (level == 0) OpenGroup(row, false);
            return std::nullopt;
        case kKeyUp:
            row = (std::max(row, 0) + count - 1) % count;
            if (level == 0) OpenGroup(row, false);
            return std::nullopt;
        case kKeyRight:
        case kKeyEnter:
        case U' ':
            if (level == 1 && press.key == kKeyRight) return std::nullopt;
            return Choose(level, std::max(row, 0));
        case kKeyLeft:
            if (level == 1) m_levels[1].row = -1;
            return std::nullopt;
        case kKeyEscape:
        case kKeyMenu:
            if (level == 1 && press.key == kKeyEscape)
                m_levels[1].row = -1;
            else
                Close();
            return std::nullopt;
        default:
            break;
    }
    if (press.key >= 0x80) return std::nullopt;
    const auto at = kKeys.find(static_cast<char>(press.key));
    return at == std::string_view::npos ? std::nullopt : Choose(level, static_cast<int>(at));
}

// In as many columns as the rows need to stay within the bounds.
void Menu::LayOut(DrawTarget& target, Level& level, int index, PointF corner, const RectF& bounds) {
    const float scale = target.Scale(), size = Look::kInfoSize * scale, pad = kPad * scale;
    const int count = RowCount(index);
    float width = 0.0f;
    for (int row = 0; row < count; ++row) {
        float text = target.MeasureText(TextOf(index, row), size).width;
        if (index == 0)
            text += 2.0f * pad;
        else if (const std::string& shortcut = m_groups[static_cast<std::size_t>(m_group)]
                                                   .entries[static_cast<std::size_t>(row)]
                                                   .shortcut;
                 !shortcut.empty())
            text += target.MeasureText(shortcut, size).width + 3.0f * pad;
        width = std::max(width, text);
    }
    width = std::ceil(width + (kKeyWidth + (index == 1 ? kTickWidth : 0.0f)) * scale + 2.0f * pad);
    // Smaller rows rather than more columns than there is room for.
    float height = std::round(kRowHeight * scale);
    const auto mostRows = [&] {
        return std::max(static_cast<int>((bounds.height - 2.0f * pad) / height), 1);
    };
    const auto columnsFor = [&] { return (count + mostRows() - 1) / mostRows(); };
    while (columnsFor() > 1 && static_cast<float>(columnsFor()) * width > bounds.width &&
           height > Look::kInfoSize * scale)
        --height;
    const int columns = columnsFor(), rows = (count + columns - 1) / columns;
    level.box = {corner.x, corner.y, static_cast<float>(columns) * width,
                 static_cast<float>(rows) * height + pad};
    const auto inside = [](float at, float length, float first, float room) {
        return std::round(std::max(std::min(at, first + room - length), first));
    };
    level.box.x = inside(level.box.x, level.box.width, bounds.x, bounds.width);
    level.box.y = inside(level.box.y, level.box.height, bounds.y, bounds.height);
    level.rows.clear();
    for (int row = 0; row < count; ++row)
        level.rows.push_back({level.box.x + static_cast<float>(row / rows) * width,
                              level.box.y + pad / 2.0f + static_cast<float>(row % rows) * height, width,
                              height});
}

void Menu::DrawLevel(DrawTarget& target, int index) const {
    const Level& level = m_levels[index];
    const float scale = target.Scale(), size = Look::kInfoSize * scale, pad = kPad * scale;
    target.FillRoundedRectangle(level.box, pad / 2.0f, {Look::kBox});
    target.OutlineRectangle(level.box, {{Look::kGrid}, std::max(std::round(scale), 1.0f)});
    for (std::size_t i = 0; i < level.rows.size(); ++i) {
        const RectF& row = level.rows[i];
        const int number = static_cast<int>(i);
        const bool lit = number == level.row;
        if (lit) target.FillRectangle(row, {Look::kGrid});
        const float baseline = row.y + (row.height + Corvo::kCapHeight * size) / 2.0f;
        const float right = row.x + row.width - pad;
        float x = row.x + pad;
        target.Text(KeyOf(number), {x, baseline}, TextAlign::Left, size, {Look::kLabel, 170});
        x += kKeyWidth * scale;
        if (index == 0) {
            target.Text("\u203a", {right, baseline}, TextAlign::Right, size, {Look::kLabel});
        } else {
            const MenuEntry& entry = m_groups[static_cast<std::size_t>(m_group)].entries[i];
            if (entry.checked) {
                const float middle = row.y + row.height / 2.0f, unit = 4.0f * scale;
                const PointF tick[] = {
                    {x, middle}, {x + unit, middle + unit}, {x + 2.5f * unit, middle - unit}};
                target.Polyline(tick, 3, {{Look::kInTune}, 2.0f * scale});
            }
            x += kTickWidth * scale;
            target.Text(entry.shortcut, {right, baseline}, TextAlign::Right, size, {Look::kLabel});
        }
        target.Text(TextOf(index, number), {x, baseline}, TextAlign::Left, size, {Look::kText});
    }
}

void Menu::Draw(DrawTarget& target, const RectF& bounds) {
    if (!m_open) return;
    LayOut(target, m_levels[0], 0, m_place, bounds);
    DrawLevel(target, 0);
    if (m_group < 0) return;
    const RectF& box = m_levels[0].box;
    const RectF& parent = m_levels[0].rows[static_cast<std::size_t>(m_group)];
    LayOut(target, m_levels[1], 1, {parent.x + parent.width, parent.y - kPad / 2.0f * target.Scale()},
           bounds);
    RectF& second = m_levels[1].box;
    // On the other side where there is no room, never over the row that it belongs to.
    if (second.x < parent.x + parent.width && box.x - second.width >= bounds.x)
        LayOut(target, m_levels[1], 1, {box.x - second.width, parent.y}, bounds);
    DrawLevel(target, 1);
}

}  // namespace analyser
