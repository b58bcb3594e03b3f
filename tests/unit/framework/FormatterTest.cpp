#include "Formatter.h"

#include <gtest/gtest.h>

#include "Text.h"
#include "autocli/AutoCli.h"

namespace FrameworkTest {
namespace {

using namespace Kalmor::MetaObj;
using Kalmor::AutoCli::App::FindFormatter;
using Kalmor::AutoCli::App::FormatOptions;
using Kalmor::AutoCli::App::Formatters;

std::string Format(const std::string& formatter, const MetaObject& root,
                   const FormatOptions& options = FormatOptions()) {
    auto function = FindFormatter(formatter);
    EXPECT_NE(function, nullptr) << formatter;
    return function ? function(root, options) : std::string();
}

void SetFields(MetaStruct&) {}
template <typename Value, typename... Rest>
void SetFields(MetaStruct& structure, const char* field, const std::shared_ptr<Value>& value,
               const Rest&... rest) {
    structure.SetField(field, value, MetaStruct::_docEmpty);
    SetFields(structure, rest...);
}

// Struct("Name", "Field", value, "Field", value, ...)
template <typename... Fields>
std::shared_ptr<MetaStruct> Struct(const std::string& name, const Fields&... fields) {
    auto structure = MetaStruct::New(name);
    SetFields(*structure, fields...);
    return structure;
}

std::shared_ptr<MetaList> Texts(std::initializer_list<const char*> texts) {
    auto list = MetaList::New(META_STRING);
    for (const char* text : texts) list->Add(text);
    return list;
}

FormatOptions Options(std::vector<std::pair<std::string, std::string>> outputParameters) {
    FormatOptions options;
    options.outputParameters = std::move(outputParameters);
    return options;
}

TEST(SimpleFormatter, TitledBlocksInDisplayOrderWithUnits) {
    auto info = Struct("Info", "Enabled", MetaBool::New(true), "Hidden",
                       MetaString::New("not listed"), "Members", Texts({"a", "b"}), "Count",
                       MetaInt::New(2), "Generation", MetaString::New());
    // The display list may end in a comma; a field it leaves out is not shown.
    FormatOptions options = Options({{"header:Info", "Cluster Information"},
                                     {"fields:Info", "Enabled,Count,Members,Generation,"}});
    EXPECT_EQ(Format("simple", *info, options),
              "Cluster Information\n   Enabled: true\n   Count: 2\n   Members: a, b\n"
              "   Generation:\n");
    options.fieldsGiven = true;
    options.fields = {"Count", "Hidden"};
    EXPECT_EQ(Format("simple", *info, options),
              "Cluster Information\n   Count: 2\n   Hidden: not listed\n");
    EXPECT_EQ(Format("json", *info, options), "{\"Count\":2,\"Hidden\":\"not listed\"}\n");

    // A title names each element from its own fields; blocks are set apart by a blank line. A
    // reference to no field, and a lone %, stay as written; an empty value gets no unit.
    auto disks = MetaList::New(META_STRUCT);
    disks->Add(Struct("Disk", "Device", MetaString::New("mpx:T0"), "Size", MetaInt::New(100)));
    disks->Add(Struct("Disk", "Device", MetaString::New("mpx:T1"), "Size", MetaInt::New()));
    EXPECT_EQ(
        Format("simple", *disks,
               Options({{"header:Disk", "%Device% at 100% (%Nope%)"}, {"units:Disk.Size", "GB"}})),
        "mpx:T0 at 100% (%Nope%)\n   Device: mpx:T0\n   Size: 100 GB\n\n"
        "mpx:T1 at 100% (%Nope%)\n   Device: mpx:T1\n   Size:\n");

    // Without a title the fields stand alone; nested structures indent under their field.
    auto inner = MetaList::New(META_STRUCT);
    inner->Add(Struct("Inner", "A", MetaInt::New(1)));
    EXPECT_EQ(Format("simple", *Struct("Outer", "Name", MetaString::New("x"), "Inner", inner)),
              "Name: x\nInner:\n   A: 1\n");
}

TEST(TableFormatter, AlignedColumnsUnderHeaderAndRule) {
    // Columns are measured in characters, not bytes; the last one is not padded.
    auto disks = MetaList::New(META_STRUCT);
    disks->Add(
        Struct("Disk", "Name", MetaString::New("\xC3\xA9t\xC3\xA9"), "Size", MetaInt::New(12321)));
    disks->Add(Struct("Disk", "Name", MetaString::New("disk-b"), "Size", MetaInt::New(1)));
    FormatOptions options = Options({{"header:Disk", "Disks"}, {"units:Disk.Size", "GB"}});
    EXPECT_EQ(Format("table", *disks, options),
              "Disks\nName    Size\n------  --------\n\xC3\xA9t\xC3\xA9     12321 GB\n"
              "disk-b  1 GB\n");
    options.noHeader = true;
    options.fieldsGiven = true;
    options.fields = {"Size", "Name"};
    EXPECT_EQ(Format("table", *disks, options), "12321 GB  \xC3\xA9t\xC3\xA9\n1 GB      disk-b\n");
    // A structure is a one-row table; a title naming its fields is left to the columns.
    EXPECT_EQ(Format("table", *disks->GetElements().back(), Options({{"header:Disk", "%Name%"}})),
              "Name    Size\n------  ----\ndisk-b  1\n");
}

TEST(Formatters, RowsSayWhichHonourFieldsAndNoHeader) {
    auto disks = MetaList::New(META_STRUCT);
    disks->Add(Struct("Disk", "Name", MetaString::New("nm-x"), "Size", MetaInt::New(777), "Model",
                      MetaString::New("m"), "Parts", Texts({"p"})));
    FormatOptions options;
    options.fieldsGiven = true;
    options.fields = {"Size", "Parts", "Name"};
    options.noHeader = true;
    for (const auto& formatter : Formatters()) {
        const std::string text = formatter.function(*disks, options);
        EXPECT_EQ(text.find("Model") == std::string::npos, formatter.honoursFields) << text;
        EXPECT_LT(text.find("777"), text.find("nm-x")) << text;
        EXPECT_EQ(text.find("Name") == std::string::npos, formatter.honoursNoHeader) << text;
    }
}

TEST(Formatters, ListingHandedOverInPiecesIsTheWholeText) {
    auto disks = MetaList::New(META_STRUCT);
    for (int i = 0; i < 3000; ++i) {
        // Rows of some 60 bytes even in csv, so that every formatter hands over a few pieces.
        const std::string name = "disk-" + std::string(40, 'd') + std::to_string(i);
        disks->Add(Struct("Disk", "Name", MetaString::New(name), "Size", MetaInt::New(i), "Ssd",
                          MetaBool::New(i % 2 == 0)));
    }
    for (const auto& formatter : Formatters()) {
        FormatOptions options = Options({{"header:Disk", "%Name%"}});
        const std::string whole = formatter.function(*disks, options);
        std::string pieces;
        size_t count = 0;
        options.flush = [&](const std::string& piece) {
            EXPECT_GE(piece.size(), Kalmor::AutoCli::App::kFlushSize) << formatter.name;
            pieces += piece;
            ++count;
        };
        EXPECT_EQ(pieces + formatter.function(*disks, options), whole) << formatter.name;
        EXPECT_GT(count, 1u) << formatter.name;
    }
}

TEST(Formatters, BareBooleanIsSilentWhenTrueExceptInMachineFormats) {
    const std::vector<std::vector<std::string>> cases = {
        {"simple", "", "false\n"},
        {"table", "", "false\n"},
        {"json", "true\n", "false\n"},
        {"csv", "value\r\ntrue\r\n", "value\r\nfalse\r\n"},
    };
    for (const auto& entry : cases) {
        EXPECT_EQ(Format(entry[0], *MetaBool::New(true)), entry[1]) << entry[0];
        EXPECT_EQ(Format(entry[0], *MetaBool::New(false)), entry[2]) << entry[0];
    }
}

TEST(JsonFormatter, CompactInDeclaredOrderWithNullsAndNoThrowOnBadUtf8) {
    auto items = MetaList::New(META_STRUCT);
    items->Add(Struct("Item", "N", MetaInt::New(1), "Texts", Texts({"x"})));
    auto root = Struct("R", "Text", MetaString::New("a\"b\\\n\x07"), "Int",
                       MetaInt::New(-9223372036854775807LL - 1), "Bool", MetaBool::New(false),
                       "Empty", MetaString::New(), "NoInt", MetaInt::New(), "Items", items, "Bad",
                       MetaString::New("ok\xFF\xFE"));
    EXPECT_EQ(Format("json", *root),
              "{\"Text\":\"a\\\"b\\\\\\n\\u0007\",\"Int\":-9223372036854775808,\"Bool\":false,"
              "\"Empty\":null,\"NoInt\":null,\"Items\":[{\"N\":1,\"Texts\":[\"x\"]}],"
              "\"Bad\":\"ok\xEF\xBF\xBD\xEF\xBF\xBD\"}\n");
    EXPECT_EQ(Format("json-pretty", *MetaList::New(META_STRING)), "[]\n");
}

TEST(CsvFormatter, QuotesAsRfc4180AndHasOneRowPerStructure) {
    auto rows = MetaList::New(META_STRUCT);
    auto row = Struct("Row", "Plain", MetaString::New("abc"), "Comma", MetaString::New("a,b"),
                      "Quote", MetaString::New("say \"hi\""), "Lines", MetaString::New("1\n2"));
    rows->Add(row);
    rows->Add(row);
    // A list cell is a JSON array, so that items holding ", " split back.
    row->SetField("List", Texts({"a, b", "c"}), MetaStruct::_docEmpty);
    const std::string line =
        "abc,\"a,b\",\"say \"\"hi\"\"\",\"1\n2\",\"[\"\"a, b\"\",\"\"c\"\"]\"\r\n";
    const std::string body = line + line;
    EXPECT_EQ(Format("csv", *rows), "Plain,Comma,Quote,Lines,List\r\n" + body);
    FormatOptions noHeader;
    noHeader.noHeader = true;
    EXPECT_EQ(Format("csv", *rows, noHeader), body);
    EXPECT_EQ(Format("csv", *Texts({"cluster", "x,y"})), "value\r\ncluster\r\n\"x,y\"\r\n");
}

TEST(TableFormatter, PadsByDisplayWidthAndShowsControlsEscaped) {
    using Kalmor::AutoCli::App::DisplayWidth;
    using Kalmor::AutoCli::App::ScreenText;
    const struct {
        const char* text;
        size_t width;
        const char* shown;
    } cases[] = {
        {"\xE6\x97\xA5\xE6\x9C\xAC", 4, nullptr},  // CJK: two columns each
        {"e\xCC\x81\xCC\xA3", 1, nullptr},         // combining marks: none
        {"\xF0\x9F\x98\x80!", 3, nullptr},         // emoji
        {"a\xFF\xE6\x97", 4, "a\xFF\xE6\\x97"},    // bad bytes: one column each
        {"\x1b]0;t\x07", 6, "\\x1b]0;t\\x07"},     // C0 from the host
        {"a\tb\r\n\x7f", 6, "a\\tb\\r\\n\\x7f"},   // tab, line ends, DEL
        {"\xC2\x9B+\x9B+", 4, "\\u009b+\\x9b+"},   // C1, and as a stray byte
        {"abc\177defgh", 9, "abc\\x7fdefgh"},      // within eight bytes read at once
        {"ab\001cdefgh", 9, "ab\\x01cdefgh"},
    };
    auto rows = MetaList::New(META_STRUCT);
    for (const auto& entry : cases) {
        EXPECT_EQ(DisplayWidth(entry.text), entry.width) << entry.text;
        EXPECT_EQ(ScreenText(entry.text), entry.shown ? entry.shown : entry.text);
        rows->Add(Struct("R", "Text", MetaString::New(entry.text), "End", MetaString::New("|")));
    }
    // Every "|" stands in the same column of the screen: after the widest text (12) and the gap.
    const std::string table = Format("table", *rows);
    for (size_t end = table.find("|\n"); end != std::string::npos;
         end = table.find("|\n", end + 1)) {
        const size_t start = table.rfind('\n', end) + 1;
        EXPECT_EQ(DisplayWidth(table.substr(start, end - start)), 14u) << table.substr(start, end);
    }
}

TEST(XmlFormatter, StableDocumentWithoutForbiddenCharacters) {
    // Markup in printable ASCII, and along with what XML cannot carry; a tab in an attribute.
    auto root = Struct("R&D\t", "Text", MetaString::New("<a & \"b\">\x01\x1f\tend\xEF\xBF\xBF"),
                       "Plain", MetaString::New("<p & \"q\">"), "Empty", MetaString::New(), "Count",
                       MetaInt::New(3), "Texts", Texts({"x"}));
    EXPECT_EQ(
        Format("xml", *root),
        "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n"
        "<output>\n"
        "  <structure name=\"R&amp;D&#9;\">\n"
        "    <field name=\"Text\"><string>&lt;a &amp; &quot;b&quot;&gt;\tend</string></field>\n"
        "    <field name=\"Plain\"><string>&lt;p &amp; &quot;q&quot;&gt;</string></field>\n"
        "    <field name=\"Empty\"><string/></field>\n"
        "    <field name=\"Count\"><integer>3</integer></field>\n"
        "    <field name=\"Texts\">\n"
        "      <list type=\"string\">\n"
        "        <string>x</string>\n"
        "      </list>\n"
        "    </field>\n"
        "  </structure>\n"
        "</output>\n");
}

}  // namespace
}  // namespace FrameworkTest
