#include <algorithm>
#include <memory>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "commands/storage/StorageRemove.h"

namespace OrvaneCli {
namespace MeskNamespace {
namespace {

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
