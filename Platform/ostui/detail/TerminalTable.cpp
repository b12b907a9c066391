// Lays the rows of a tree out in columns.
#include "ostui/detail/TerminalTable.h"

#include <algorithm>
#include <numeric>
#include <string>

#include "ostui/detail/TerminalText.h"

namespace ostui {
namespace detail {

using ostcore::U8String;

namespace {

constexpr std::size_t kGap = 2;
constexpr std::size_t kIndent = 2;
/// Rows further below the top are not moved in any more.
constexpr std::size_t kDeepest = 10;
/// A column is not made narrower than this.
constexpr std::size_t kNarrowest = 6;

using Line = std::vector<U8String>;

/// How far below the top each row is.
std::vector<std::size_t> DepthsOf(const Tree& inTree) {
    std::vector<std::size_t> depths;
    for (const TreeRow& row : inTree.GetRows()) {
        const bool isTop = row.parent == TreeRow::kTopLevel;
        depths.push_back(isTop ? 0 : depths[static_cast<std::size_t>(row.parent)] + 1);
    }
    return depths;
}

Line CellsOf(const Tree& inTree, int inRow, std::size_t inDepth) {
    const TreeRow& row = inTree.GetRows()[static_cast<std::size_t>(inRow)];
    Line cells;
    for (const TreeColumn& column : inTree.GetColumns()) {
        const auto cell = static_cast<std::size_t>(inTree.GetCell(column.id));
        cells.push_back(cell < row.cells.size() ? SafeLine(row.cells[cell]) : U8String());
    }
    if (!cells.empty()) {
        cells.front().insert(0, std::min(inDepth, kDeepest) * kIndent, ' ');
    }
    return cells;
}

std::vector<std::size_t> WidthsOf(const std::vector<Line>& inLines, std::size_t inWidth) {
    std::vector<std::size_t> widths(inLines.front().size());
    for (const Line& line : inLines) {
        for (std::size_t i = 0; i < line.size(); ++i) {
            widths[i] = std::max(widths[i], DisplayWidth(line[i]));
        }
    }
    if (inWidth == 0 || widths.empty()) {
        return widths;
    }
    // The widest one gives way until all fit.
    std::size_t total = std::accumulate(widths.begin(), widths.end(), kGap * (widths.size() - 1));
    auto widest = std::max_element(widths.begin(), widths.end());
    while (total > inWidth && *widest > kNarrowest) {
        --*widest;
        --total;
        widest = std::max_element(widths.begin(), widths.end());
    }
    return widths;
}

U8String Join(const Line& inLine, const std::vector<std::size_t>& inWidths) {
    U8String text;
    for (std::size_t i = 0; i < inLine.size(); ++i) {
        text += PadTo(Truncate(inLine[i], inWidths[i]), inWidths[i] + kGap);
    }
    text.erase(text.find_last_not_of(' ') + 1);
    return text;
}

}  // namespace

std::vector<U8String> TableLines(const Tree& inTree, const std::vector<int>& inRows, bool inHasNumbers,
                                 std::size_t inWidth) {
    std::vector<Line> lines(1);
    for (const TreeColumn& column : inTree.GetColumns()) {
        lines.front().push_back(SafeLine(column.title));
    }
    const std::vector<std::size_t> depths = DepthsOf(inTree);
    for (const int row : inRows) {
        lines.push_back(CellsOf(inTree, row, depths[static_cast<std::size_t>(row)]));
    }
    const std::size_t numberWidth = std::to_string(inRows.size()).size();
    const std::size_t indent = inHasNumbers ? numberWidth + 2 * kGap : 0;
    const std::vector<std::size_t> widths = WidthsOf(lines, inWidth > indent ? inWidth - indent : inWidth);
    std::vector<U8String> texts;
    for (std::size_t i = 0; i < lines.size(); ++i) {
        const U8String number = inHasNumbers && i > 0 ? std::to_string(i) : U8String();
        const U8String margin =
            inHasNumbers ? U8String(kGap + numberWidth - number.size(), ' ') + number + U8String(kGap, ' ')
                         : U8String();
        texts.push_back(margin + Join(lines[i], widths));
    }
    return texts;
}

}  // namespace detail
}  // namespace ostui
