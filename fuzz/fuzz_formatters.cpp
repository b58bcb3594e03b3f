// Fuzzes the formatters over arbitrary result trees.
//
// The input describes a result (structures, lists and scalars with any names and texts, also
// list elements that do not match their template) and the output parameters a command could
// give. Every formatter must handle it; each one is read back as its row says: JSON parses,
// XML is well-formed, CSV reads back, by RFC 4180, as the very cells of the result's grid (as
// UTF-8 text); what is for the terminal holds no control character.
#include <fuzzer/FuzzedDataProvider.h>

#include <nlohmann/json.hpp>

#include <cstdint>
#include <cstdlib>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "Formatter.h"
#include "FuzzCheck.h"
#include "Text.h"
#include "autocli/MetaObj.h"

using Kalmor::AutoCli::App::BuildGrid;
using Kalmor::AutoCli::App::CellStyle;
using Kalmor::AutoCli::App::FormatOptions;
using Kalmor::AutoCli::App::Grid;
using Kalmor::AutoCli::App::OutputLayout;
using Kalmor::AutoCli::App::ReadBack;
using Kalmor::MetaObj::MetaBool;
using Kalmor::MetaObj::MetaInt;
using Kalmor::MetaObj::MetaList;
using Kalmor::MetaObj::MetaObject;
using Kalmor::MetaObj::MetaString;
using Kalmor::MetaObj::MetaStruct;
namespace MetaObj = Kalmor::MetaObj;
namespace App = Kalmor::AutoCli::App;

namespace {

// ---- Building a result from the input --------------------------------------------------

constexpr int kMaxDepth = 3;

std::shared_ptr<MetaStruct> MakeStruct(FuzzedDataProvider& in, int depth);

std::shared_ptr<MetaList> MakeList(FuzzedDataProvider& in, int depth) {
    if (in.ConsumeBool() || depth >= kMaxDepth) {
        auto list = MetaList::New(MetaObj::META_STRING);
        const size_t count = in.ConsumeIntegralInRange<size_t>(0, 4);
        for (size_t i = 0; i < count; ++i) list->Add(in.ConsumeRandomLengthString(24));
        return list;
    }
    auto list = MetaList::New(MetaObj::META_STRUCT, MakeStruct(in, depth + 1));
    const size_t count = in.ConsumeIntegralInRange<size_t>(0, 4);
    for (size_t i = 0; i < count; ++i) list->Add(MakeStruct(in, depth + 1));
    return list;
}

void SetField(FuzzedDataProvider& in, MetaStruct& structure, int depth) {
    const std::string name = in.ConsumeRandomLengthString(16);
    switch (in.ConsumeIntegralInRange<int>(0, 6)) {
        case 0:
            structure.SetField(name, MetaString::New(in.ConsumeRandomLengthString(32)),
                               MetaStruct::_docEmpty);
            break;
        case 1:
            structure.SetField(name, MetaInt::New(in.ConsumeIntegral<int64_t>()),
                               MetaStruct::_docEmpty);
            break;
        case 2:
            structure.SetField(name, MetaBool::New(in.ConsumeBool()), MetaStruct::_docEmpty);
            break;
        case 3:
            structure.SetField(name, MetaString::New(), MetaStruct::_docEmpty);
            break;
        case 4:
            structure.SetField(name, MetaInt::New(), MetaStruct::_docEmpty);
            break;
        case 5:
            structure.SetField(name, MetaBool::New(), MetaStruct::_docEmpty);
            break;
        default:
            structure.SetField(name, MakeList(in, depth), MetaStruct::_docEmpty);
            break;
    }
}

std::shared_ptr<MetaStruct> MakeStruct(FuzzedDataProvider& in, int depth) {
    // A few short names, so that elements and templates often share a name.
    auto structure = MetaStruct::New(in.ConsumeBool() ? "S" : in.ConsumeRandomLengthString(12));
    const size_t count = in.ConsumeIntegralInRange<size_t>(0, 6);
    for (size_t i = 0; i < count; ++i) SetField(in, *structure, depth);
    return structure;
}

std::shared_ptr<MetaObject> MakeRoot(FuzzedDataProvider& in) {
    switch (in.ConsumeIntegralInRange<int>(0, 5)) {
        case 0:
            return MakeStruct(in, 0);
        case 1:
            return MakeList(in, 0);
        case 2:
            return MetaString::New(in.ConsumeRandomLengthString(32));
        case 3:
            return MetaInt::New(in.ConsumeIntegral<int64_t>());
        case 4:
            return MetaBool::New(in.ConsumeBool());
        default:
            return MetaString::New();
    }
}

FormatOptions MakeOptions(FuzzedDataProvider& in) {
    static const char* const kPrefixes[] = {"header:", "fields:", "units:", ""};
    FormatOptions options;
    const size_t count = in.ConsumeIntegralInRange<size_t>(0, 4);
    for (size_t i = 0; i < count; ++i) {
        std::string key = kPrefixes[in.ConsumeIntegralInRange<size_t>(0, 3)];
        key += in.ConsumeRandomLengthString(16);
        options.outputParameters.emplace_back(key, in.ConsumeRandomLengthString(32));
    }
    options.fieldsGiven = in.ConsumeBool();
    if (options.fieldsGiven) {
        const size_t fields = in.ConsumeIntegralInRange<size_t>(1, 4);
        for (size_t i = 0; i < fields; ++i) {
            options.fields.push_back(in.ConsumeRandomLengthString(16));
        }
    }
    options.noHeader = in.ConsumeBool();
    return options;
}

// ---- XML: a small well-formedness check ------------------------------------------------

// Length of the valid UTF-8 sequence at text[i] of a character that XML 1.0 allows, or 0.
size_t XmlChar(const std::string& text, size_t i) {
    const auto byte = [&text](size_t k) { return static_cast<unsigned char>(text[k]); };
    const unsigned char lead = byte(i);
    if (lead < 0x80) return (lead >= 0x20 || lead == '\t' || lead == '\n' || lead == '\r') ? 1 : 0;
    size_t length = lead >= 0xF0 ? 4 : lead >= 0xE0 ? 3 : lead >= 0xC2 ? 2 : 0;
    if (length == 0 || lead > 0xF4 || i + length > text.size()) return 0;
    uint32_t code = lead & (0x7F >> length);
    for (size_t k = 1; k < length; ++k) {
        if ((byte(i + k) & 0xC0) != 0x80) return 0;
        code = (code << 6) | (byte(i + k) & 0x3F);
    }
    const uint32_t lowest[] = {0, 0, 0x80, 0x800, 0x10000};
    if (code < lowest[length] || code > 0x10FFFF) return 0;
    if ((code >= 0xD800 && code <= 0xDFFF) || code == 0xFFFE || code == 0xFFFF) return 0;
    return length;
}

bool IsNameChar(char c) {
    return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || (c >= '0' && c <= '9') || c == '-' ||
           c == '_' || c == '.' || c == ':';
}

// Checks character references and the five predefined entities in character data.
bool ValidReferences(const std::string& text) {
    size_t i = 0;
    while ((i = text.find('&', i)) != std::string::npos) {
        const size_t end = text.find(';', i);
        if (end == std::string::npos) return false;
        const std::string name = text.substr(i + 1, end - i - 1);
        if (name == "amp" || name == "lt" || name == "gt" || name == "quot" || name == "apos") {
            i = end + 1;
            continue;
        }
        if (name.size() < 2 || name[0] != '#') return false;
        uint32_t code = 0;
        for (size_t k = 1; k < name.size(); ++k) {
            if (name[k] < '0' || name[k] > '9' || code > 0x10FFFF) return false;
            code = code * 10 + static_cast<uint32_t>(name[k] - '0');
        }
        const bool allowed =
            code == 0x9 || code == 0xA || code == 0xD || (code >= 0x20 && code <= 0xD7FF) ||
            (code >= 0xE000 && code <= 0xFFFD) || (code >= 0x10000 && code <= 0x10FFFF);
        if (!allowed) return false;
        i = end + 1;
    }
    return true;
}

// True iff `xml` is one well-formed document of the shape the xml formatter writes: the
// declaration, then elements with double-quoted attributes, character data and references,
// balanced, under one root.
bool WellFormedXml(const std::string& xml) {
    for (size_t i = 0; i < xml.size();) {
        const size_t length = XmlChar(xml, i);
        if (length == 0) return false;
        i += length;
    }
    const std::string declaration = "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n";
    if (xml.compare(0, declaration.size(), declaration) != 0) return false;
    std::vector<std::string> open;
    bool rootSeen = false;
    size_t i = declaration.size();
    while (i < xml.size()) {
        if (xml[i] != '<') {
            const size_t next = xml.find('<', i);
            const std::string data = xml.substr(i, next == std::string::npos ? next : next - i);
            if (data.find('>') != std::string::npos || !ValidReferences(data)) return false;
            if (open.empty() && data.find_first_not_of(" \t\r\n") != std::string::npos) {
                return false;
            }
            if (next == std::string::npos) break;
            i = next;
            continue;
        }
        const bool closing = i + 1 < xml.size() && xml[i + 1] == '/';
        size_t k = i + (closing ? 2 : 1);
        const size_t nameStart = k;
        while (k < xml.size() && IsNameChar(xml[k])) ++k;
        if (k == nameStart) return false;
        const std::string name = xml.substr(nameStart, k - nameStart);
        if (closing) {
            if (k >= xml.size() || xml[k] != '>' || open.empty() || open.back() != name) {
                return false;
            }
            open.pop_back();
            i = k + 1;
            continue;
        }
        if (open.empty() && rootSeen) return false;
        rootSeen = true;
        std::vector<std::string> attributes;
        while (true) {
            while (k < xml.size() && xml[k] == ' ') ++k;
            if (k >= xml.size()) return false;
            if (xml[k] == '>' || (xml[k] == '/' && k + 1 < xml.size() && xml[k + 1] == '>')) {
                break;
            }
            const size_t attributeStart = k;
            while (k < xml.size() && IsNameChar(xml[k])) ++k;
            if (k == attributeStart || k + 1 >= xml.size() || xml[k] != '=' || xml[k + 1] != '"') {
                return false;
            }
            const std::string attribute = xml.substr(attributeStart, k - attributeStart);
            for (const auto& seen : attributes) {
                if (seen == attribute) return false;
            }
            attributes.push_back(attribute);
            const size_t valueEnd = xml.find('"', k + 2);
            if (valueEnd == std::string::npos) return false;
            const std::string value = xml.substr(k + 2, valueEnd - k - 2);
            if (value.find('<') != std::string::npos || !ValidReferences(value)) return false;
            k = valueEnd + 1;
        }
        if (xml[k] == '/') {
            i = k + 2;
        } else {
            open.push_back(name);
            i = k + 1;
        }
    }
    return rootSeen && open.empty();
}

// ---- CSV: an RFC 4180 reader -----------------------------------------------------------

// Reads records of fields separated by commas and ended by CR LF; a quoted field may hold
// commas, quotation marks (doubled) and line breaks. Returns false on a malformed text.
bool ReadCsv(const std::string& text, std::vector<std::vector<std::string>>& records) {
    size_t i = 0;
    while (i < text.size()) {
        std::vector<std::string> record;
        while (true) {
            std::string field;
            if (i < text.size() && text[i] == '"') {
                ++i;
                while (true) {
                    if (i >= text.size()) return false;
                    if (text[i] == '"') {
                        if (i + 1 < text.size() && text[i + 1] == '"') {
                            field += '"';
                            i += 2;
                            continue;
                        }
                        ++i;
                        break;
                    }
                    field += text[i++];
                }
            } else {
                while (i < text.size() && text[i] != ',' && text[i] != '\r') {
                    if (text[i] == '"' || text[i] == '\n') return false;
                    field += text[i++];
                }
            }
            record.push_back(field);
            if (i >= text.size()) return false;  // every record ends with a line break
            if (text[i] == ',') {
                ++i;
                continue;
            }
            if (text.compare(i, 2, "\r\n") != 0) return false;
            i += 2;
            break;
        }
        records.push_back(std::move(record));
    }
    return true;
}

// The csv output reads back as the cells of the result's grid, or one value per record.
void CheckCsv(const std::string& csv, const MetaObject& root, const FormatOptions& options) {
    std::vector<std::vector<std::string>> records;
    FUZZ_CHECK(ReadCsv(csv, records));
    OutputLayout layout(options);
    Grid grid;
    if (BuildGrid(root, layout, CellStyle::kMachine, grid)) {
        // Cells as text: bytes that are not UTF-8 come out as U+FFFD.
        std::vector<std::vector<std::string>> expected;
        if (!grid.columns.empty()) {
            if (!options.noHeader) expected.push_back(grid.columns);
            expected.insert(expected.end(), grid.rows.begin(), grid.rows.end());
        }
        for (auto& record : expected) {
            for (auto& cell : record) cell = App::ValidUtf8(cell);
        }
        FUZZ_CHECK(records == expected);
    } else {
        for (const auto& record : records) FUZZ_CHECK(record.size() == 1);
    }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    FuzzedDataProvider in(data, size);
    const FormatOptions options = MakeOptions(in);
    const std::shared_ptr<MetaObject> root = MakeRoot(in);

    for (const auto& formatter : App::Formatters()) {
        const std::string text = formatter.function(*root, options);
        switch (formatter.readBack) {
            case ReadBack::kNone:
                // For the terminal: no control character but its own line breaks (C1 is
                // 0xC2 0x80 to 0xC2 0x9F in UTF-8), whatever the host reported.
                for (size_t i = 0; i < text.size(); ++i) {
                    const auto byte = static_cast<unsigned char>(text[i]);
                    FUZZ_CHECK(byte == '\n' || (byte >= 0x20 && byte != 0x7F));
                    FUZZ_CHECK(byte != 0xC2 || i + 1 == text.size() ||
                               (static_cast<unsigned char>(text[i + 1]) & 0xE0) != 0x80);
                }
                break;
            case ReadBack::kJson: {
                FUZZ_CHECK(!nlohmann::json::parse(text, nullptr, false).is_discarded());
                // Written straight out, it must be what the JSON library makes of the result.
                const int indent = std::string(formatter.name) == "json-pretty" ? 2 : -1;
                FUZZ_CHECK(
                    text ==
                    App::ToJson(root.get(), options.fieldsGiven ? &options.fields : nullptr)
                            .dump(indent, ' ', false, nlohmann::json::error_handler_t::replace) +
                        "\n");
                break;
            }
            case ReadBack::kXml:
                FUZZ_CHECK(WellFormedXml(text));
                break;
            case ReadBack::kCsv:
                CheckCsv(text, *root, options);
                break;
        }
    }
    return 0;
}
