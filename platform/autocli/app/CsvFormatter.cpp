// The "csv" formatter: a header row of field names and one row per structure, each record
// ended by CR LF as RFC 4180 has it. A cell holding a list is a JSON array.
#include "Formatter.h"
#include "Text.h"

namespace Kalmor {
namespace AutoCli {
namespace App {

namespace {

// Quotes a cell when it holds a comma, a quotation mark or a line break, doubling the
// quotation marks inside. Bytes that are not UTF-8 become U+FFFD, as in the JSON output, so
// that a reader decoding UTF-8 gets the same text from both.
void AppendCell(std::string& text, const std::string& raw) {
    std::string clean;
    const std::string& value = ValidUtf8(raw, clean);
    if (value.find_first_of(",\"\r\n") == std::string::npos) {
        text += value;
        return;
    }
    text += '"';
    for (char c : value) {
        text += c;
        if (c == '"') {
            text += '"';
        }
    }
    text += '"';
}

void AppendRow(std::string& text, const std::vector<std::string>& cells) {
    for (size_t i = 0; i < cells.size(); ++i) {
        if (i != 0) {
            text += ',';
        }
        AppendCell(text, cells[i]);
    }
    text += "\r\n";
}

}  // namespace

std::string FormatCsv(const MetaObj::MetaObject& root, const FormatOptions& options) {
    OutputLayout layout(options);
    Grid grid;
    if (!BuildGrid(root, layout, CellStyle::kMachine, grid)) {
        // Texts, integers and booleans: one column named "value".
        grid.columns = {"value"};
        if (root.GetType() == MetaObj::META_LIST) {
            for (const auto& element : static_cast<const MetaObj::MetaList&>(root).GetElements()) {
                grid.rows.push_back({ValueText(element.get())});
            }
        } else {
            std::string value = ValueText(&root);
            if (!value.empty()) {
                grid.rows.push_back({value});
            }
        }
    }
    if (grid.columns.empty()) {
        return std::string();
    }
    std::string text;
    if (!options.noHeader) {
        AppendRow(text, grid.columns);
    }
    for (const auto& row : grid.rows) {
        AppendRow(text, row);
        FlushIfLarge(text, options);
    }
    return text;
}

}  // namespace App
}  // namespace AutoCli
}  // namespace Kalmor
