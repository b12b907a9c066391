// Tables for people: columns aligned by display width, and shortened where a terminal is too narrow.
#pragma once

#include <cstddef>
#include <string>
#include <vector>

namespace zo {

class Table {
public:
    struct Column {
        std::string title;
        /// A column is never made narrower than this, and a rigid one (0) not at all.
        std::size_t minimumWidth = 0;
        bool alignRight = false;
    };

    explicit Table(std::vector<Column> inColumns) : mColumns(std::move(inColumns)) {}

    /// Cells of any origin; they are made safe for a terminal here.
    void AddRow(std::vector<std::string> inCells);
    bool IsEmpty() const noexcept { return mRows.empty(); }
    std::size_t RowCount() const noexcept { return mRows.size(); }

    /// The lines, header first. With a width of 0 nothing is cut; otherwise the widest columns that may
    /// shrink give way until the lines fit, or none can shrink any further.
    std::vector<std::string> Lines(std::size_t inTerminalWidth) const;

private:
    std::vector<std::size_t> Widths(std::size_t inTerminalWidth) const;
    std::string Line(const std::vector<std::string>& inCells, const std::vector<std::size_t>& inWidths) const;

    std::vector<Column> mColumns;
    std::vector<std::vector<std::string>> mRows;
};

}  // namespace zo
