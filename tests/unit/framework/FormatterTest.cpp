#include "Formatter.h"

#include <unistd.h>

#include <gtest/gtest.h>

#include "autocli/AutoCli.h"

namespace FrameworkTest {
namespace {

using namespace Kalmor::MetaObj;
using Kalmor::AutoCli::App::FindFormatter;
using Kalmor::AutoCli::App::FormatOptions;

const std::string& Doc() {
    return MetaStruct::_docEmpty;
}

std::string Format(const std::string& formatter, const MetaObject& root,
                   const FormatOptions& options = FormatOptions()) {
    auto function = FindFormatter(formatter);
    EXPECT_NE(function, nullptr) << formatter;
    return function ? function(root, options) : std::string();
}

std::shared_ptr<MetaStruct> ClusterInfo() {
    auto info = MetaStruct::New("MeskClusterGet");
    info->SetField("Enabled", MetaBool::New(true), Doc());
    info->SetField("Hidden", MetaString::New("not listed"), Doc());
    info->SetField("Local Node UUID", MetaString::New("52f1c2a0-7b3e-4d01-9a6e-00a1b2c3d4e5"),
                   Doc());
    auto members = MetaList::New(META_STRING);
    members->Add("a");
    members->Add("b");
    info->SetField("Sub-Cluster Member UUIDs", members, Doc());
    info->SetField("Sub-Cluster Member Count", MetaInt::New(2), Doc());
    info->SetField("Config Generation", MetaString::New(), Doc());
    return info;
}

FormatOptions ClusterOptions() {
    FormatOptions options;
    options.outputParameters = {
        {"header:MeskClusterGet", "Cluster Information"},
        {"fields:MeskClusterGet",
         "Enabled,Local Node UUID,Sub-Cluster Member Count,Sub-Cluster Member UUIDs,"
         "Config Generation,"},
    };
    return options;
}

std::shared_ptr<MetaStruct> Agent(const std::string& uuid, bool witness, const std::string& ip,
                                  int64_t port) {
    auto agent = MetaStruct::New("UnicastAgentList");
    agent->SetField("NodeUuid", MetaString::New(uuid), Doc());
    agent->SetField("IsWitness", MetaBool::New(witness), Doc());
    agent->SetField("IP Address", MetaString::New(ip), Doc());
    agent->SetField("Port", MetaInt::New(port), Doc());
    return agent;
}

std::shared_ptr<MetaList> Agents() {
    auto agents = MetaList::New(META_STRUCT, Agent("", false, "", 0));
    agents->Add(Agent("00000000-0000-0000-0000-000000000000", true, "10.0.0.1", 12321));
    agents->Add(Agent("52f1c2a0-7b3e-4d01-9a6e-00a1b2c3d4e5", false, "fe80::1", 1));
    return agents;
}

FormatOptions AgentOptions() {
    FormatOptions options;
    options.outputParameters = {{"header:UnicastAgentList", "Unicast Agent"},
                                {"fields:UnicastAgentList", "NodeUuid,IsWitness,IP Address,Port"}};
    return options;
}

std::shared_ptr<MetaList> Disks() {
    auto disks = MetaList::New(META_STRUCT);
    struct Disk {
        const char* device;
        bool ssd;
        int64_t size;
    };
    for (const Disk& entry :
         {Disk{"mpx.pthba2:C0:T0:L0", true, 100}, Disk{"mpx.pthba2:C0:T1:L0", false, 2000}}) {
        auto disk = MetaStruct::New("MeskStorageList");
        disk->SetField("Device", MetaString::New(entry.device), Doc());
        disk->SetField("Is SSD", MetaBool::New(entry.ssd), Doc());
        disk->SetField("Size", MetaInt::New(entry.size), Doc());
        disks->Add(disk);
    }
    return disks;
}

FormatOptions DiskOptions() {
    FormatOptions options;
    options.outputParameters = {{"header:MeskStorageList", "%Device%"},
                                {"units:MeskStorageList.Size", "GB"}};
    return options;
}

TEST(SimpleFormatter, TitledBlocksInDisplayOrderWithUnits) {
    EXPECT_EQ(Format("simple", *ClusterInfo(), ClusterOptions()),
              "Cluster Information\n"
              "   Enabled: true\n"
              "   Local Node UUID: 52f1c2a0-7b3e-4d01-9a6e-00a1b2c3d4e5\n"
              "   Sub-Cluster Member Count: 2\n"
              "   Sub-Cluster Member UUIDs: a, b\n"
              "   Config Generation:\n");

    EXPECT_EQ(Format("simple", *Disks(), DiskOptions()),
              "mpx.pthba2:C0:T0:L0\n"
              "   Device: mpx.pthba2:C0:T0:L0\n"
              "   Is SSD: true\n"
              "   Size: 100 GB\n"
              "\n"
              "mpx.pthba2:C0:T1:L0\n"
              "   Device: mpx.pthba2:C0:T1:L0\n"
              "   Is SSD: false\n"
              "   Size: 2000 GB\n");

    // Without a title the fields stand alone; an empty value gets no unit.
    auto throttle = MetaStruct::New("ResyncThrottle");
    throttle->SetField("Level", MetaInt::New(100), Doc());
    throttle->SetField("Burst", MetaInt::New(), Doc());
    FormatOptions units;
    units.outputParameters = {{"units:ResyncThrottle.Level", "Mbps"},
                              {"units:ResyncThrottle.Burst", "Mbps"}};
    EXPECT_EQ(Format("simple", *throttle, units), "Level: 100 Mbps\nBurst:\n");
}

TEST(SimpleFormatter, TitleReplacesFieldReferencesOnly) {
    auto item = MetaStruct::New("Item");
    item->SetField("Name", MetaString::New("disk1"), Doc());
    FormatOptions options;
    options.outputParameters = {{"header:Item", "Item %Name% at 100% (%Nope%)"}};
    EXPECT_EQ(Format("simple", *item, options), "Item disk1 at 100% (%Nope%)\n   Name: disk1\n");
}

TEST(SimpleFormatter, NestedStructuresIndentUnderTheirField) {
    auto outer = MetaStruct::New("Outer");
    outer->SetField("Name", MetaString::New("x"), Doc());
    auto inner = MetaList::New(META_STRUCT);
    auto element = MetaStruct::New("Inner");
    element->SetField("A", MetaInt::New(1), Doc());
    inner->Add(element);
    outer->SetField("Inner", inner, Doc());
    EXPECT_EQ(Format("simple", *outer), "Name: x\nInner:\n   A: 1\n");
}

TEST(TableFormatter, AlignedColumnsUnderHeaderAndRule) {
    EXPECT_EQ(Format("table", *Agents(), AgentOptions()),
              "Unicast Agent\n"
              "NodeUuid                              IsWitness  IP Address  Port\n"
              "------------------------------------  ---------  ----------  -----\n"
              "00000000-0000-0000-0000-000000000000  true       10.0.0.1    12321\n"
              "52f1c2a0-7b3e-4d01-9a6e-00a1b2c3d4e5  false      fe80::1     1\n");

    // A structure is a one-row table; a per-element title is left to the columns.
    auto disk = Disks()->GetElements().front();
    EXPECT_EQ(Format("table", *disk, DiskOptions()),
              "Device               Is SSD  Size\n"
              "-------------------  ------  ------\n"
              "mpx.pthba2:C0:T0:L0  true    100 GB\n");

    FormatOptions bare = AgentOptions();
    bare.noHeader = true;
    bare.fieldsGiven = true;
    bare.fields = {"Port", "IP Address"};
    EXPECT_EQ(Format("table", *Agents(), bare),
              "12321  10.0.0.1\n"
              "1      fe80::1\n");

    // Columns are measured in characters, not bytes.
    auto wide = MetaStruct::New("W");
    wide->SetField("Name", MetaString::New("\xC3\xA9t\xC3\xA9"), Doc());
    wide->SetField("N", MetaInt::New(1), Doc());
    EXPECT_EQ(Format("table", *wide), "Name  N\n----  -\n\xC3\xA9t\xC3\xA9   1\n");
}

TEST(Formatters, FieldsOptionNarrowsAndOrdersSimpleTableAndCsv) {
    FormatOptions options = ClusterOptions();
    options.fieldsGiven = true;
    options.fields = {"Sub-Cluster Member Count", "Hidden"};
    EXPECT_EQ(Format("simple", *ClusterInfo(), options),
              "Cluster Information\n   Sub-Cluster Member Count: 2\n   Hidden: not listed\n");
    EXPECT_EQ(Format("csv", *ClusterInfo(), options),
              "Sub-Cluster Member Count,Hidden\n2,not listed\n");
    // JSON carries everything.
    EXPECT_NE(Format("json", *ClusterInfo(), options).find("\"Enabled\":true"), std::string::npos);
}

TEST(JsonFormatter, CompactInDeclaredOrderWithNullsAndNoThrowOnBadUtf8) {
    auto root = MetaStruct::New("R");
    root->SetField("Text", MetaString::New("a\"b"), Doc());
    root->SetField("Int", MetaInt::New(-9223372036854775807LL - 1), Doc());
    root->SetField("Bool", MetaBool::New(false), Doc());
    root->SetField("Empty", MetaString::New(), Doc());
    root->SetField("NoInt", MetaInt::New(), Doc());
    auto texts = MetaList::New(META_STRING);
    texts->Add("x");
    root->SetField("Texts", texts, Doc());
    root->SetField("Agents", Agents(), Doc());
    root->SetField("Bad", MetaString::New("ok\xFF\xFE"), Doc());
    EXPECT_EQ(Format("json", *root),
              "{\"Text\":\"a\\\"b\",\"Int\":-9223372036854775808,\"Bool\":false,\"Empty\":null,"
              "\"NoInt\":null,\"Texts\":[\"x\"],\"Agents\":[{\"NodeUuid\":"
              "\"00000000-0000-0000-0000-000000000000\",\"IsWitness\":true,\"IP Address\":"
              "\"10.0.0.1\",\"Port\":12321},{\"NodeUuid\":\"52f1c2a0-7b3e-4d01-9a6e-00a1b2c3d4e5\","
              "\"IsWitness\":false,\"IP Address\":\"fe80::1\",\"Port\":1}],"
              "\"Bad\":\"ok\xEF\xBF\xBD\xEF\xBF\xBD\"}\n");
    EXPECT_EQ(Format("json-pretty", *MetaList::New(META_STRING)), "[]\n");
}

TEST(Formatters, BareBooleanIsSilentWhenTrueExceptInMachineFormats) {
    struct Case {
        const char* formatter;
        std::string forTrue;
        std::string forFalse;
    };
    const std::vector<Case> cases = {
        {"simple", "", "false\n"},
        {"table", "", "false\n"},
        {"json", "true\n", "false\n"},
        {"json-pretty", "true\n", "false\n"},
        {"csv", "value\ntrue\n", "value\nfalse\n"},
    };
    for (const auto& entry : cases) {
        EXPECT_EQ(Format(entry.formatter, *MetaBool::New(true)), entry.forTrue) << entry.formatter;
        EXPECT_EQ(Format(entry.formatter, *MetaBool::New(false)), entry.forFalse)
            << entry.formatter;
    }
}

TEST(CsvFormatter, QuotesAsRfc4180AndHasOneRowPerStructure) {
    auto rows = MetaList::New(META_STRUCT);
    auto row = MetaStruct::New("Row");
    row->SetField("Plain", MetaString::New("abc"), Doc());
    row->SetField("Comma", MetaString::New("a,b"), Doc());
    row->SetField("Quote", MetaString::New("say \"hi\""), Doc());
    row->SetField("Lines", MetaString::New("1\n2"), Doc());
    rows->Add(row);
    rows->Add(row);
    EXPECT_EQ(Format("csv", *rows),
              "Plain,Comma,Quote,Lines\n"
              "abc,\"a,b\",\"say \"\"hi\"\"\",\"1\n2\"\n"
              "abc,\"a,b\",\"say \"\"hi\"\"\",\"1\n2\"\n");

    auto texts = MetaList::New(META_STRING);
    texts->Add("cluster");
    texts->Add("x,y");
    EXPECT_EQ(Format("csv", *texts), "value\ncluster\n\"x,y\"\n");

    FormatOptions noHeader = AgentOptions();
    noHeader.noHeader = true;
    EXPECT_EQ(Format("csv", *Agents(), noHeader),
              "00000000-0000-0000-0000-000000000000,true,10.0.0.1,12321\n"
              "52f1c2a0-7b3e-4d01-9a6e-00a1b2c3d4e5,false,fe80::1,1\n");
}

TEST(XmlFormatter, StableDocumentWithoutForbiddenCharacters) {
    auto root = MetaStruct::New("R&D");
    root->SetField("Text", MetaString::New("<a & \"b\">\x01\x1f\tend\xEF\xBF\xBF"), Doc());
    root->SetField("Empty", MetaString::New(), Doc());
    root->SetField("Count", MetaInt::New(3), Doc());
    auto texts = MetaList::New(META_STRING);
    texts->Add("x");
    root->SetField("Texts", texts, Doc());
    root->SetField("None", MetaList::New(META_STRING), Doc());
    const std::string xml = Format("xml", *root);
    EXPECT_EQ(
        xml,
        "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n"
        "<output>\n"
        "  <structure name=\"R&amp;D\">\n"
        "    <field name=\"Text\"><string>&lt;a &amp; &quot;b&quot;&gt;\tend</string></field>\n"
        "    <field name=\"Empty\"><string/></field>\n"
        "    <field name=\"Count\"><integer>3</integer></field>\n"
        "    <field name=\"Texts\">\n"
        "      <list type=\"string\">\n"
        "        <string>x</string>\n"
        "      </list>\n"
        "    </field>\n"
        "    <field name=\"None\">\n"
        "      <list type=\"string\"/>\n"
        "    </field>\n"
        "  </structure>\n"
        "</output>\n");

    if (access("/usr/bin/xmllint", X_OK) != 0) {
        GTEST_SKIP() << "xmllint is not installed";
    }
    auto hostile = MetaStruct::New("H");
    std::string everyByte;
    for (int c = 0; c < 256; ++c) {
        everyByte += static_cast<char>(c);
    }
    hostile->SetField(everyByte, MetaString::New(everyByte + "\xED\xA0\x80"), Doc());
    std::string ignored;
    EXPECT_EQ(
        Kalmor::AutoCli::AutoCli_ShellCmd("xmllint --noout -", ignored, Format("xml", *hostile)),
        0);
}

}  // namespace
}  // namespace FrameworkTest
