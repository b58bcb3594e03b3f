// The "table" formatter: aligned columns under a header row and a rule, padded by the
// columns a terminal gives each text; cells are shown through ScreenText.
#include <algorithm>

#include "Formatter.h"
#include "Text.h"

namespace Kalmor {
namespace AutoCli {
namespace App {

namespace {

constexpr char kColumnGap[] = "  ";

void AppendRow(std::string& text, const std::vector<std::string>& cells,
               const std::vector<size_t>& widths) {
    const size_t start = text.size();
    for (size_t i = 0; i < cells.size(); ++i) {
        if (i != 0) {
            text += kColumnGap;
        }
        text += cells[i];
        if (i + 1 != cells.size()) {
            const size_t width = DisplayWidth(cells[i]);
            if (width < widths[i]) {
                text.append(widths[i] - width, ' ');
            }
        }
    }
    const size_t end = text.find_last_not_of(' ');
    text.resize(end == std::string::npos || end < start ? start : end + 1);
    text += '\n';
}

}  // namespace

std::string FormatTable(const MetaObj::MetaObject& root, const FormatOptions& options) {
    OutputLayout layout(options);
    Grid grid;
    if (!BuildGrid(root, layout, CellStyle::kScreen, grid)) {
        return PlainText(root);
    }
    if (grid.columns.empty()) {
        return std::string();
    }

    std::vector<size_t> widths;
    for (const auto& column : grid.columns) {
        widths.push_back(DisplayWidth(column));
    }
    for (const auto& row : grid.rows) {
        for (size_t i = 0; i < row.size(); ++i) {
            widths[i] = std::max(widths[i], DisplayWidth(row[i]));
        }
    }

    std::string text;
    if (!options.noHeader) {
        // A title that names a field differs per row: the column says it already.
        if (layout.HasTitle(grid.structName) && !layout.TitleNamesFields(grid.structName)) {
            text += ScreenText(layout.RawTitle(grid.structName)) + "\n";
        }
        AppendRow(text, grid.columns, widths);
        std::vector<std::string> rule;
        for (size_t width : widths) {
            rule.push_back(std::string(width, '-'));
        }
        AppendRow(text, rule, widths);
    }
    for (const auto& row : grid.rows) {
        AppendRow(text, row, widths);
        FlushIfLarge(text, options);
    }
    return text;
}

}  // namespace App
}  // namespace AutoCli
}  // namespace Kalmor
