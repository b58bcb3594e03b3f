// Formatters: a command's result as text for administrators and scripts.
#pragma once

#include <charconv>
#include <cstdint>
#include <cstring>
#include <functional>
#include <map>
#include <string>
#include <utility>
#include <vector>

#include <nlohmann/json_fwd.hpp>

#include "autocli/MetaObj.h"

namespace Kalmor {
namespace AutoCli {
namespace App {

// What shapes a result besides the result itself.
struct FormatOptions {
    // The command's default output parameters ("header:", "fields:" and "units:" keys).
    std::vector<std::pair<std::string, std::string>> outputParameters;
    // --fields: the fields to show of each top-level structure, in this order.
    bool fieldsGiven = false;
    std::vector<std::string> fields;
    // --no-header: no header row in the formatters whose row says they have one.
    bool noHeader = false;
    // When set, the formatters that write a listing element by element hand it the text made
    // so far each time it has grown past kFlushSize, and go on with an empty text: a long
    // listing is printed as it is made instead of being held whole. The formatter returns
    // what is left.
    std::function<void(const std::string&)> flush;
};

// How much text a formatter holds before it hands it to FormatOptions::flush.
constexpr size_t kFlushSize = 64 * 1024;

// Hands `text` to options.flush and empties it, when there is a flush and the text has grown
// past kFlushSize.
void FlushIfLarge(std::string& text, const FormatOptions& options);

// The command's "header:", "fields:" and "units:" parameters, looked up by structure name.
// One layout serves the structures of one result, which must outlive it: it keeps what it
// chose for the last structure and hands it out again for the next one with the same fields.
class OutputLayout {
  public:
    explicit OutputLayout(const FormatOptions& options);

    // The title of a structure: its "header:" text with every "%Field%" replaced by that
    // field's value; empty when it has none.
    std::string Title(const MetaObj::MetaStruct& structure) const;
    // Whether the structure has a "header:" parameter at all.
    bool HasTitle(const std::string& structName) const;
    // The "header:" text as the command gave it, or empty.
    std::string RawTitle(const std::string& structName) const;
    // Whether the structure's title names one of its fields, so that it differs per element.
    bool TitleNamesFields(const std::string& structName) const;

    // The fields of a structure to show.
    struct Selection {
        // Their positions in the structure, in display order: --fields for a top-level
        // structure when given, else the "fields:" list, else every field in declared order.
        // Names the structure does not have are left out.
        std::vector<size_t> fields;
        // The unit label of each, or empty.
        std::vector<std::string> units;
        // Changes whenever the selection is made anew, so that a formatter may keep what it
        // derives from one.
        unsigned serial = 0;
    };
    const Selection& Select(const MetaObj::MetaStruct& structure, bool topLevel) const;
    // The unit label of a field, or empty.
    std::string Unit(const std::string& structName, const std::string& field) const;

  private:
    const FormatOptions& options_;
    std::map<std::string, std::string> titles_;
    std::map<std::string, std::vector<std::string>> fields_;
    std::map<std::string, std::string> units_;  // key: "<StructName>.<Field>"
    // The last selection for a top-level [1] and a nested [0] structure, and whose it was.
    mutable Selection selections_[2];
    mutable const MetaObj::MetaStruct* selectedFor_[2] = {nullptr, nullptr};
    mutable unsigned serials_ = 0;
};

// The text of a scalar (empty when it has no value), of a list of texts joined by ", ", and
// of anything else as compact JSON; followed by the unit, if any, when there is a value.
std::string ValueText(const MetaObj::MetaObject* value, const std::string& unit = std::string());
// ValueText(value) appended to `out`.
void AppendValueText(std::string& out, const MetaObj::MetaObject* value);

// A structure or a list of structures as rows of cells under named columns: a structure
// is one row, a list one row per element. The columns are the fields shown of the first
// element (or of the list's template when the list is empty).
struct Grid {
    std::string structName;
    std::vector<std::string> columns;
    std::vector<std::vector<std::string>> rows;
};

// How a grid's cells are written.
enum class CellStyle {
    // For a person at a terminal: with unit labels, control characters escaped (ScreenText).
    kScreen,
    // For a program: no units, and a list as a JSON array so that it splits back whatever
    // its items hold.
    kMachine,
};

// Fills `grid` from a structure or a list of structures and returns true; returns false for
// any other result.
bool BuildGrid(const MetaObj::MetaObject& root, const OutputLayout& layout, CellStyle style,
               Grid& grid);

// The structure that a command's result holds, from its output description or a result: a
// top-level structure, or the element template of a list of structures; nullptr otherwise.
const MetaObj::MetaStruct* ResultStructure(const MetaObj::MetaObject* root);

// The field names of ResultStructure(root), in order: what --fields may name. Empty when the
// result is no structure.
std::vector<std::string> FieldNames(const MetaObj::MetaObject* root);

// A result that is not a structure or a list of structures, as "simple" and "table" print
// it: a text or integer on one line, a list of texts one per line, and a boolean as nothing
// for true and "false" for false (scripts test the exit status; a bare "true" would only
// clutter the terminal).
std::string PlainText(const MetaObj::MetaObject& root);

// The result as JSON: structures as objects with fields in declared order, lists as arrays,
// empty scalars as null. With `fields`, a top-level structure (the result, or an element of
// a result that is a list) has only those fields, in that order.
nlohmann::ordered_json ToJson(const MetaObj::MetaObject* value,
                              const std::vector<std::string>* fields = nullptr);

// Makes room in `text` for a listing of `count` elements, judged by the first one that it
// holds now: for all of them, or for what is held until the next flush.
void ReserveForListing(std::string& text, size_t count, const FormatOptions& options);

// Writes into room made at once at the end of a text, for a piece whose greatest length is
// known before it is written: no check of the text's capacity for each part. Done() cuts the
// text to what was written.
class TextRoom {
  public:
    TextRoom(std::string& text, size_t bytes) : text_(text) {
        const size_t start = text.size();
        text.resize(start + bytes);
        out_ = &text[start];
    }
    void Put(const char* data, size_t size) {
        std::memcpy(out_, data, size);
        out_ += size;
    }
    void Put(const std::string& data) { Put(data.data(), data.size()); }
    void Put(char c) { *out_++ = c; }
    void Put(int64_t number) { out_ = std::to_chars(out_, out_ + 20, number).ptr; }
    void Done() { text_.resize(static_cast<size_t>(out_ - text_.data())); }

  private:
    std::string& text_;
    char* out_;
};

using FormatterFunction = std::string (*)(const MetaObj::MetaObject& root,
                                          const FormatOptions& options);

std::string FormatSimple(const MetaObj::MetaObject& root, const FormatOptions& options);
std::string FormatTable(const MetaObj::MetaObject& root, const FormatOptions& options);
std::string FormatJson(const MetaObj::MetaObject& root, const FormatOptions& options);
std::string FormatJsonPretty(const MetaObj::MetaObject& root, const FormatOptions& options);
std::string FormatXml(const MetaObj::MetaObject& root, const FormatOptions& options);
std::string FormatCsv(const MetaObj::MetaObject& root, const FormatOptions& options);

// How a test or fuzz target reads a formatter's output back to check it.
enum class ReadBack {
    kNone,  // for a person: not read back
    kJson,  // one JSON document
    kXml,   // one well-formed XML document
    kCsv,   // RFC 4180 records, the very cells of the result's grid (CellStyle::kMachine)
};

// One formatter and what it honours. Help, the fuzz target and the tests read these rows, so
// that a new formatter is one row here and its own source file.
struct FormatterRow {
    const char* name;
    FormatterFunction function;
    bool honoursFields;    // --fields narrows and orders the top-level fields
    bool honoursNoHeader;  // --no-header drops its header row
    ReadBack readBack;
};

// Every formatter, in the order help lists them.
const std::vector<FormatterRow>& Formatters();
// The formatter of that name, or nullptr.
FormatterFunction FindFormatter(const std::string& name);
// The formatter names, in the order help lists them.
const std::vector<std::string>& FormatterNames();

}  // namespace App
}  // namespace AutoCli
}  // namespace Kalmor
