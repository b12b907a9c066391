// Lays out the columns of a table.
#include "Table.h"

#include <algorithm>
#include <numeric>

#include "DisplayWidth.h"

namespace zo {
namespace {

constexpr std::size_t kGap = 2;

}  // namespace

void Table::AddRow(std::vector<std::string> inCells) {
    for (std::string& cell : inCells) {
        cell = ForTerminal(cell);
    }
    inCells.resize(mColumns.size());
    mRows.push_back(std::move(inCells));
}

std::vector<std::string> Table::Lines(std::size_t inTerminalWidth) const {
    const std::vector<std::size_t> widths = Widths(inTerminalWidth);
    std::vector<std::string> titles;
    for (const Column& column : mColumns) {
        titles.push_back(column.title);
    }
    std::vector<std::string> lines{Line(titles, widths)};
    for (const std::vector<std::string>& row : mRows) {
        lines.push_back(Line(row, widths));
    }
    return lines;
}

std::vector<std::size_t> Table::Widths(std::size_t inTerminalWidth) const {
    std::vector<std::size_t> widths;
    for (std::size_t index = 0; index < mColumns.size(); ++index) {
        std::size_t width = DisplayWidth(mColumns[index].title);
        for (const std::vector<std::string>& row : mRows) {
            width = std::max(width, DisplayWidth(row[index]));
        }
        widths.push_back(width);
    }
    if (inTerminalWidth == 0 || mColumns.empty()) {
        return widths;
    }
    const std::size_t gaps = kGap * (mColumns.size() - 1);
    std::size_t total = std::accumulate(widths.begin(), widths.end(), gaps);
    while (total > inTerminalWidth) {
        std::size_t widest = widths.size();
        for (std::size_t index = 0; index < widths.size(); ++index) {
            const bool canShrink =
                mColumns[index].minimumWidth > 0 && widths[index] > mColumns[index].minimumWidth;
            if (canShrink && (widest == widths.size() || widths[index] > widths[widest])) {
                widest = index;
            }
        }
        if (widest == widths.size()) {
            break;
        }
        --widths[widest];
        --total;
    }
    return widths;
}

std::string Table::Line(const std::vector<std::string>& inCells,
                        const std::vector<std::size_t>& inWidths) const {
    std::string line;
    for (std::size_t index = 0; index < inCells.size(); ++index) {
        const std::string cell = Truncate(inCells[index], inWidths[index]);
        const std::string padding(inWidths[index] - std::min(inWidths[index], DisplayWidth(cell)), ' ');
        line += mColumns[index].alignRight ? padding + cell : cell + padding;
        if (index + 1 < inCells.size()) {
            line += std::string(kGap, ' ');
        }
    }
    line.erase(line.find_last_not_of(' ') + 1);
    return line;
}

}  // namespace zo
