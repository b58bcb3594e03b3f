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

// One row per hostile text, with an integer and a boolean that alternate in sign and value.
int64_t NumberOf(size_t row) {
    return (row % 2 == 0 ? -3 : 7) * static_cast<int64_t>(row + 1);
}

std::shared_ptr<MetaList> Rows() {
    auto rows = MetaList::New(META_STRUCT, MetaStruct::New("Row"));
    for (size_t i = 0; i < HostileTexts().size(); ++i) {
        auto row = MetaStruct::New("Row");
        row->SetField(kTextField, MetaString::New(HostileTexts()[i]), MetaStruct::_docEmpty);
        row->SetField("Number", MetaInt::New(NumberOf(i)), MetaStruct::_docEmpty);
        row->SetField("Flag", MetaBool::New(i % 2 == 0), MetaStruct::_docEmpty);
        rows->Add(row);
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
    for (const char* formatter : {"json", "json-pretty"}) {
        nlohmann::ordered_json document;
        ASSERT_NO_THROW(document = nlohmann::ordered_json::parse(Format(formatter, *Rows())));
        ASSERT_EQ(document.size(), HostileTexts().size()) << formatter;
        for (size_t i = 0; i < HostileTexts().size(); ++i) {
            nlohmann::ordered_json expected = nlohmann::ordered_json::object();
            expected[kTextField] = ValidUtf8(HostileTexts()[i]);
            expected["Number"] = NumberOf(i);
            expected["Flag"] = i % 2 == 0;
            EXPECT_EQ(document[i].dump(), expected.dump()) << formatter << " row " << i;
        }
    }
}

TEST(FormatterRoundTrip, CsvReadsBackEveryCell) {
    const auto read = ReadCsv(Format("csv", *Rows()));
    ASSERT_EQ(read.size(), HostileTexts().size() + 1);
    EXPECT_EQ(read[0], (std::vector<std::string>{kTextField, "Number", "Flag"}));
    for (size_t i = 0; i < HostileTexts().size(); ++i) {
        EXPECT_EQ(read[i + 1], (std::vector<std::string>{ValidUtf8(HostileTexts()[i]),
                                                         std::to_string(NumberOf(i)),
                                                         i % 2 == 0 ? "true" : "false"}))
            << i;
    }
}

TEST(FormatterRoundTrip, XmlIsWellFormedAndReadsBackEveryText) {
    if (access("/usr/bin/xmllint", X_OK) != 0) {
        GTEST_SKIP() << "xmllint is not installed";
    }
    const std::string xml = Format("xml", *Rows());
    std::string ignored;
    ASSERT_EQ(Kalmor::AutoCli::AutoCli_ShellCmd("xmllint --noout -", ignored, xml), 0);
    char file[] = "/tmp/mesk-roundtrip-XXXXXX";
    int fd = mkstemp(file);
    ASSERT_GE(fd, 0);
    ASSERT_EQ(write(fd, xml.data(), xml.size()), static_cast<ssize_t>(xml.size()));
    close(fd);

    for (size_t i = 0; i < HostileTexts().size(); ++i) {
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
        EXPECT_EQ(read, ValidUtf8(HostileTexts()[i], true)) << i;
    }
    unlink(file);
}

}  // namespace
}  // namespace FrameworkTest
