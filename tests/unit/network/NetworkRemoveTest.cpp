#include <functional>
#include <string>

#include "MockHost.h"
#include "commands/network/NetworkClear.h"
#include "commands/network/NetworkIpRemove.h"
#include "commands/network/NetworkRemove.h"
#include "commands/network/NetworkRestore.h"

namespace OrvaneCli {
namespace MeskNamespace {
namespace {

using Kalmor::CallSpec::Input;
using MeskTest::BoolResult;
using MeskTest::Errors;
using MeskTest::Fail;
using MeskTest::HostTest;
using ::testing::_;
using ::testing::ElementsAre;
using ::testing::InSequence;
using ::testing::IsEmpty;
using ::testing::Return;

class NetworkRemoveTest : public HostTest {
  protected:
    struct RemoveCommand {
        const char* name;
        std::function<std::shared_ptr<Kalmor::AutoCli::Command>()> make;
    };
    const RemoveCommand removeCommands[2] = {{"ip remove", [] { return NetworkIpRemove::New(); }},
                                             {"remove", [] { return NetworkRemove::New(); }}};

    static std::shared_ptr<Input> Named(bool force) {
        auto input = Input::New();
        input->SetParameter("interface-name", "vmk1");
        if (force) input->SetFlag("force");
        return input;
    }
};

TEST_F(NetworkRemoveTest, BothRemoveCommandsAskForMeskThenWitness) {
    for (const auto& command : removeCommands) {
        for (bool force : {false, true}) {
            SCOPED_TRACE(::testing::Message() << command.name << " force " << force);
            {
                InSequence order;
                EXPECT_CALL(info, RemoveZuvNic("vmk1", force, "mesk")).WillOnce(Return(false));
                EXPECT_CALL(info, RemoveZuvNic("vmk1", force, "witness")).WillOnce(Return(false));
            }
            auto output = Run(*command.make(), Named(force));
            EXPECT_THAT(Errors(*output), IsEmpty());
            EXPECT_TRUE(BoolResult(*output));
            EXPECT_TRUE(output->IsComplete());
            ::testing::Mock::VerifyAndClearExpectations(&info);
        }
    }
}

TEST_F(NetworkRemoveTest, AFailedRemovalIsFalseAndCompleteAndStopsTheWitnessRemoval) {
    for (const auto& command : removeCommands) {
        {
            SCOPED_TRACE(::testing::Message() << command.name << ": mesk removal fails");
            EXPECT_CALL(info, RemoveZuvNic("vmk1", false, "mesk"))
                .WillOnce(Fail("vmk1 is not configured"));
            EXPECT_CALL(info, RemoveZuvNic(_, _, "witness")).Times(0);
            auto output = Run(*command.make(), Named(false));
            EXPECT_THAT(Errors(*output), ElementsAre("vmk1 is not configured"));
            EXPECT_FALSE(BoolResult(*output));
            EXPECT_TRUE(output->IsComplete());
            ::testing::Mock::VerifyAndClearExpectations(&info);
        }
        {
            SCOPED_TRACE(::testing::Message() << command.name << ": witness removal fails");
            InSequence order;
            EXPECT_CALL(info, RemoveZuvNic("vmk1", true, "mesk")).WillOnce(Return(true));
            EXPECT_CALL(info, RemoveZuvNic("vmk1", true, "witness")).WillOnce(Fail("busy"));
            auto output = Run(*command.make(), Named(true));
            EXPECT_THAT(Errors(*output), ElementsAre("busy"));
            EXPECT_FALSE(BoolResult(*output));
            EXPECT_TRUE(output->IsComplete());
            ::testing::Mock::VerifyAndClearExpectations(&info);
        }
    }
}

TEST_F(NetworkRemoveTest, ClearAndRestoreAreTrueOrFalseAndAlwaysComplete) {
    struct Case {
        const char* name;
        std::shared_ptr<Kalmor::AutoCli::Command> command;
        std::function<void(bool fails)> expect;
    };
    const Case cases[] = {
        {"clear", NetworkClear::New(),
         [this](bool fails) {
             EXPECT_CALL(info, RestoreNetworkConfig()).Times(0);
             auto& call = EXPECT_CALL(info, ClearNetworkConfig());
             if (fails) call.WillOnce(Fail("config store locked"));
         }},
        {"restore", NetworkRestore::New(),
         [this](bool fails) {
             EXPECT_CALL(info, ClearNetworkConfig()).Times(0);
             auto& call = EXPECT_CALL(info, RestoreNetworkConfig());
             if (fails) call.WillOnce(Fail("config store locked"));
         }},
    };
    for (const auto& c : cases) {
        for (bool fails : {false, true}) {
            SCOPED_TRACE(::testing::Message() << c.name << " fails " << fails);
            c.expect(fails);
            auto output = Run(*c.command);
            EXPECT_EQ(BoolResult(*output), !fails);
            EXPECT_TRUE(output->IsComplete());
            if (fails) {
                EXPECT_THAT(Errors(*output), ElementsAre("config store locked"));
            } else {
                EXPECT_THAT(Errors(*output), IsEmpty());
            }
            ::testing::Mock::VerifyAndClearExpectations(&info);
        }
    }
}

}  // namespace
}  // namespace MeskNamespace
}  // namespace OrvaneCli
