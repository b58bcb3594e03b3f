#include <algorithm>
#include <memory>
#include <string>
#include <vector>

#include "MockHost.h"
#include "commands/storage/StorageAdd.h"
#include "commands/storage/StorageAutoModeGet.h"
#include "commands/storage/StorageAutoModeSet.h"
#include "commands/storage/StorageDiskgroupMount.h"
#include "commands/storage/StorageDiskgroupUmount.h"
#include "commands/storage/StorageList.h"
#include "commands/storage/StorageRemove.h"
#include "commands/storage/StorageTagAdd.h"
#include "commands/storage/StorageTagRemove.h"

namespace OrvaneCli {
namespace MeskNamespace {
namespace {

using Kalmor::AutoCli::Command;

// "name:short:type[:required][:enum=values]" for each parameter, in declaration order.
std::vector<std::string> Parameters(Command& command) {
    std::vector<std::string> described;
    auto spec = command.GetInputSpecInternal();
    for (const auto& p : spec->GetParameters()) {
        std::string text = p->GetName() + ":" + p->GetShortName() + ":" +
                           std::to_string(p->GetType()) + (p->IsRequired() ? ":required" : "");
        if (p->GetConstraint()) {
            text += ":enum=";
            for (const auto& value : p->GetConstraint()->GetStringEnum()) {
                text += value.value + "(" + value.description + ")";
            }
        }
        described.push_back(text);
    }
    return described;
}

TEST(StorageMetadata, DescriptionTypeFormatterParametersAndResultKind) {
    using namespace Kalmor::MetaObj;
    struct Case {
        std::shared_ptr<Command> command;
        std::string description;
        std::string typeAndFormatter;
        std::vector<std::string> parameters;
        MetaType result;
    };
    const std::string tag = "tag:t:0:required:enum=capacityFlash(Tag for capacity flash.)";
    // clang-format off
    const std::vector<Case> cases = {
        {StorageAdd::New(), "Add physical disk for Mesk usage.", "operation/",
         {"ssd:s:0:required", "disks:d:4:required"}, META_BOOL},
        {StorageRemove::New(), "Remove physical disks from Mesk disk groups.", "operation/",
         {"disk:d:0", "ssd:s:0", "uuid:u:0", "evacuation-mode:m:0"}, META_BOOL},
        {StorageList::New(), "List Mesk storage configuration.", "fetcher/simple",
         {"device:d:0", "uuid:u:0"}, META_LIST},
        {StorageAutoModeGet::New(), " Get status of storage auto claim mode.", "fetcher/simple",
         {}, META_STRUCT},
        {StorageAutoModeSet::New(), "Configure storage auto claim mode", "operation/",
         {"enabled::2"}, META_BOOL},
        {StorageDiskgroupMount::New(), "Mount a Mesk disk or disk group.", "operation/",
         {"ssd:s:0", "disk:d:0", "uuid:u:0"}, META_BOOL},
        {StorageDiskgroupUmount::New(), "Unmount Mesk disk or disk group.", "operation/",
         {"ssd:s:0", "disk:d:0"}, META_BOOL},
        {StorageTagAdd::New(), "Add a Mesk storage tag.", "operation/",
         {tag, "disk:d:0:required"}, META_BOOL},
        {StorageTagRemove::New(), "Remove a Mesk storage tag.", "operation/",
         {tag, "disk:d:0:required"}, META_BOOL},
    };
    // clang-format on
    for (const auto& c : cases) {
        SCOPED_TRACE(c.description);
        EXPECT_EQ(c.command->GetDescription(), c.description);
        EXPECT_EQ(
            c.command->GetMetaDataField("type") + "/" + c.command->GetDefaultOutputFormatter(),
            c.typeAndFormatter);
        EXPECT_EQ(Parameters(*c.command), c.parameters);
        EXPECT_EQ(c.command->GetOutputSpecInternal()->GetRootObject()->GetType(), c.result);
    }
}

TEST(StorageMetadata, EvacuationModeHelpIsFourLinesOf398Bytes) {
    auto mode = StorageRemove::New()->GetInputSpecInternal()->FindParameter("evacuation-mode");
    ASSERT_TRUE(mode);
    const std::string& help = mode->GetDescription();
    EXPECT_EQ(help.size(), 398u);
    EXPECT_EQ(std::count(help.begin(), help.end(), '\n'), 3);
    EXPECT_NE(help.find("\n    noAction: "), std::string::npos);
}

}  // namespace
}  // namespace MeskNamespace
}  // namespace OrvaneCli
