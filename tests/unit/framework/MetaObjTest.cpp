#include <gtest/gtest.h>

#include "autocli/MetaObj.h"

namespace FrameworkTest {
namespace {

using namespace Kalmor::MetaObj;

// "name=value,..." of a structure's fields, in order, with each field's documentation.
std::string Shown(const MetaStruct& structure) {
    std::string text;
    for (const auto& field : structure.GetFields()) {
        const auto* value = static_cast<const MetaString*>(field.value.get());
        text += field.name + "=" + value->GetValue() + field.documentation + ",";
    }
    return text;
}

// Structures of one name share their field names; each must still keep exactly its own
// fields, in its own order, whatever the others did before or after it.
TEST(MetaStruct, StructuresOfOneNameKeepTheirOwnFields) {
    // Each step: the fields set on a new structure "S" (name=value, "+doc" for a text), and
    // what it shows once all steps have run.
    const struct {
        std::vector<std::pair<std::string, std::string>> sets;
        std::string shown;
    } steps[] = {
        {{{"A", "1"}, {"B", "2"}, {"C", "3"}}, "A=1,B=2,C=3,"},
        {{{"A", "4"}, {"B", "5"}, {"C", "6"}}, "A=4,B=5,C=6,"},  // alike: shares the names
        {{{"A", "7"}, {"C", "8"}}, "A=7,C=8,"},                  // leaves one out
        {{{"A", "1"}, {"B", "2"}, {"A", "9"}}, "A=9,B=2,"},      // set again: keeps its place
        {{{"B", "1"}, {"A", "2"}, {"C", "3"}, {"D", "4"}}, "B=1,A=2,C=3,D=4,"},
        {{{"A", "1"}, {"B+doc", "2"}}, "A=1,B=2doc,"},  // same name, other text
        {{{"A", "1"}, {"B", "2"}, {"C", "3"}, {"D", "4"}}, "A=1,B=2,C=3,D=4,"},
    };
    auto list = MetaList::New(META_STRUCT, MetaStruct::New("S"));
    std::vector<std::shared_ptr<MetaStruct>> made;
    for (const auto& step : steps) {
        auto structure = MetaStruct::New("S");
        for (const auto& [field, value] : step.sets) {
            const size_t plus = field.find('+');
            structure->SetField(
                field.substr(0, plus), MetaString::New(value),
                plus == std::string::npos ? MetaStruct::_docEmpty : field.substr(plus + 1));
        }
        list->Add(structure);
        made.push_back(structure);
    }
    EXPECT_TRUE(made[0]->HasFieldsOf(*made[1]));
    // A field added to a structure already listed is its own too.
    made[0]->SetField("E", MetaString::New("5"), MetaStruct::_docEmpty);
    EXPECT_FALSE(made[0]->HasFieldsOf(*made[1]));
    for (size_t i = 0; i < made.size(); ++i) {
        const std::string expected = i == 0 ? "A=1,B=2,C=3,E=5," : steps[i].shown;
        EXPECT_EQ(Shown(*made[i]), expected) << "structure " << i;
    }
    EXPECT_FALSE(made[4]->HasFieldsOf(*made[6]));  // the same names in another order
    EXPECT_EQ(made[4]->FindField("C"), 2u);
    EXPECT_EQ(made[4]->GetField("E"), nullptr);
}

}  // namespace
}  // namespace FrameworkTest
