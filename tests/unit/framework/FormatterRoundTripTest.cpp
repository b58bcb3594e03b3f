// The machine formatters read back by standard parsers: JSON by nlohmann, XML by xmllint, CSV
// by an RFC 4180 reader. Hostile texts must come back as they went in, except what each
// format cannot carry: invalid UTF-8 becomes U+FFFD everywhere, and XML drops the control
// characters that XML 1.0 forbids.
#include <unistd.h>

#include <gtest/gtest.h>

#include <nlohmann/json.hpp>

#include "Formatter.h"
#include "Text.h"
#include "autocli/AutoCli.h"

namespace FrameworkTest {
namespace {

using namespace Kalmor::MetaObj;
using Kalmor::AutoCli::App::FindFormatter;
using Kalmor::AutoCli::App::FormatOptions;
using Kalmor::AutoCli::App::ValidUtf8;

const std::vector<std::string>& HostileTexts() {
    static const std::vector<std::string> texts = {
        "plain",
        "",
        "a,b",
        "say \"hi\", twice \"\"",
        "line one\nline two",
        "crlf\r\nend\r",
        "tab\there",
        "bell\x07 escape\x1b[0m nul",
        std::string("embedded\0nul", 12),
        "bad \xFF\xC3 end",
        "surrogate \xED\xA0\x80 and overlong \xC0\xAF",
        "\xC3\xA9t\xC3\xA9 \xF0\x9F\x98\x80 \xEF\xBF\xBF",
        "<tag attr='x'> & ]]>",
        "  padded  ",
    };
    return texts;
}

// Field names reach attributes in XML and the header row in CSV.
const char kTextField[] = "Text,\t\"quoted\"\nname";

// One row per hostile text, with an integer and a boolean beside it.
std::shared_ptr<MetaList> Rows() {
    auto row = [](const std::string& text, int64_t number, bool flag) {
        auto structure = MetaStruct::New("Row");
        structure->SetField(kTextField, MetaString::New(text), MetaStruct::_docEmpty);
        structure->SetField("Number", MetaInt::New(number), MetaStruct::_docEmpty);
        structure->SetField("Flag", MetaBool::New(flag), MetaStruct::_docEmpty);
        return structure;
    };
    auto rows = MetaList::New(META_STRUCT, row("", 0, false));
    int64_t number = -3;
    for (const auto& text : HostileTexts()) {
        rows->Add(row(text, number, number % 2 == 0));
        number *= -7;
    }
    return rows;
}

std::string Format(const std::string& formatter, const MetaObject& root) {
    return FindFormatter(formatter)(root, FormatOptions());
}

// Reads RFC 4180 text: cells separated by commas, rows by LF or CRLF, quoted cells may hold
// anything, with "" for a quotation mark.
std::vector<std::vector<std::string>> ReadCsv(const std::string& text) {
    std::vector<std::vector<std::string>> rows;
    std::vector<std::string> row;
    std::string cell;
    size_t i = 0;
    while (i < text.size()) {
        if (text[i] == '"' && cell.empty()) {
            for (++i; i < text.size(); ++i) {
                if (text[i] == '"' && i + 1 < text.size() && text[i + 1] == '"') {
                    cell += '"';
                    ++i;
                } else if (text[i] == '"') {
                    ++i;
                    break;
                } else {
                    cell += text[i];
                }
            }
            continue;
        }
        if (text[i] == ',') {
            row.push_back(cell);
            cell.clear();
        } else if (text[i] == '\n' ||
                   (text[i] == '\r' && i + 1 < text.size() && text[i + 1] == '\n')) {
            i += text[i] == '\r' ? 1 : 0;
            row.push_back(cell);
            cell.clear();
            rows.push_back(row);
            row.clear();
        } else {
            cell += text[i];
        }
        ++i;
    }
    EXPECT_TRUE(row.empty() && cell.empty()) << "the last row lacks its line end";
    return rows;
}

TEST(FormatterRoundTrip, JsonReadsBackEveryValue) {
    auto rows = Rows();
    for (const char* formatter : {"json", "json-pretty"}) {
        const std::string text = Format(formatter, *rows);
        nlohmann::ordered_json document;
        ASSERT_NO_THROW(document = nlohmann::ordered_json::parse(text)) << formatter;
        ASSERT_TRUE(document.is_array());
        ASSERT_EQ(document.size(), rows->Size());
        for (size_t i = 0; i < rows->Size(); ++i) {
            const auto& row = static_cast<const MetaStruct&>(*rows->GetElements()[i]);
            const auto& read = document[i];
            std::vector<std::string> keys;
            for (const auto& item : read.items()) {
                keys.push_back(item.key());
            }
            EXPECT_EQ(keys, (std::vector<std::string>{kTextField, "Number", "Flag"}));
            const auto& text = static_cast<const MetaString&>(*row.GetField(kTextField));
            EXPECT_EQ(read[kTextField].get<std::string>(), ValidUtf8(text.GetValue())) << i;
            EXPECT_EQ(read["Number"].get<int64_t>(),
                      static_cast<const MetaInt&>(*row.GetField("Number")).GetValue());
            EXPECT_EQ(read["Flag"].get<bool>(),
                      static_cast<const MetaBool&>(*row.GetField("Flag")).GetValue());
        }
    }
}

TEST(FormatterRoundTrip, CsvReadsBackEveryCell) {
    auto rows = Rows();
    const auto read = ReadCsv(Format("csv", *rows));
    ASSERT_EQ(read.size(), rows->Size() + 1);
    EXPECT_EQ(read[0], (std::vector<std::string>{kTextField, "Number", "Flag"}));
    for (size_t i = 0; i < rows->Size(); ++i) {
        const auto& row = static_cast<const MetaStruct&>(*rows->GetElements()[i]);
        const std::vector<std::string> expected = {
            ValidUtf8(static_cast<const MetaString&>(*row.GetField(kTextField)).GetValue()),
            std::to_string(static_cast<const MetaInt&>(*row.GetField("Number")).GetValue()),
            static_cast<const MetaBool&>(*row.GetField("Flag")).GetValue() ? "true" : "false"};
        EXPECT_EQ(read[i + 1], expected) << i;
    }
}

TEST(FormatterRoundTrip, XmlIsWellFormedAndReadsBackEveryText) {
    if (access("/usr/bin/xmllint", X_OK) != 0) {
        GTEST_SKIP() << "xmllint is not installed";
    }
    auto rows = Rows();
    const std::string xml = Format("xml", *rows);
    std::string ignored;
    ASSERT_EQ(Kalmor::AutoCli::AutoCli_ShellCmd("xmllint --noout -", ignored, xml), 0);
    char file[] = "/tmp/mesk-roundtrip-XXXXXX";
    int fd = mkstemp(file);
    ASSERT_GE(fd, 0);
    ASSERT_EQ(write(fd, xml.data(), xml.size()), static_cast<ssize_t>(xml.size()));
    close(fd);

    for (size_t i = 0; i < rows->Size(); ++i) {
        const auto& row = static_cast<const MetaStruct&>(*rows->GetElements()[i]);
        // xmllint prints the string and a line feed. XPath has no escape for a quotation mark
        // inside a literal, so the field name is put together with concat().
        const std::string path =
            "string(/output/list/structure[" + std::to_string(i + 1) +
            "]/field[@name=concat('Text,\t', '\"', 'quoted', '\"', '\nname')])";
        std::string read;
        ASSERT_EQ(Kalmor::AutoCli::AutoCli_ShellCmd(
                      std::string("xmllint --xpath \"$(cat)\" ") + file, read, path),
                  0)
            << i;
        ASSERT_FALSE(read.empty());
        read.pop_back();
        const std::string sent =
            static_cast<const MetaString&>(*row.GetField(kTextField)).GetValue();
        EXPECT_EQ(read, ValidUtf8(sent, true)) << i;
    }
    unlink(file);
}

}  // namespace
}  // namespace FrameworkTest
