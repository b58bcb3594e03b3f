#include <map>
#include <string>
#include <vector>

#include "MockHost.h"
#include "commands/storage/StorageList.h"
#include "hostctl/MeskUtil.h"

namespace OrvaneCli {
namespace MeskNamespace {
namespace {

using HostCtl::Mesk::MeskDiskInfo;
using Kalmor::CallSpec::Input;
using Kalmor::CallSpec::Output;
using MeskTest::Errors;
using MeskTest::Fail;
using MeskTest::FakeLun;
using MeskTest::HostTest;
using MeskTest::ListElements;
using MeskTest::LunList;
using MeskTest::TextField;
using MeskTest::Uuid;
using MeskTest::UuidOf;
using ::testing::_;
using ::testing::ElementsAreArray;
using ::testing::Invoke;

const std::string kA = "0a000000-0000-0000-0000-000000000001";
const std::string kB = "5b000000-0000-0000-0000-000000000002";
const std::string kC = "ac000000-0000-0000-0000-000000000003";

// A host whose LUNs are `luns` (name, UUID text) and whose service holds `service`. Each disk
// query reports the UUID it was asked for as "MESK UUID" and checks what the command handed it.
class StorageListTest : public HostTest {
  protected:
    void SetHost(const std::vector<std::pair<std::string, std::string>>& luns,
                 const std::vector<std::string>& service) {
        ON_CALL(host, GetMeskDisks(_)).WillByDefault(Invoke([luns](LunList& out) {
            for (const auto& lun : luns) {
                out.push_back(std::make_shared<FakeLun>(lun.first, UuidOf(lun.second)));
            }
        }));
        ON_CALL(info, GetMeskDiskUuids(_)).WillByDefault(Invoke([service](std::vector<Uuid>& out) {
            for (const auto& text : service) out.push_back(UuidOf(text));
        }));
        const size_t lunCount = luns.size();
        ON_CALL(info, GetDiskInfo(_, _, _))
            .WillByDefault(Invoke([lunCount](const Uuid& uuid, const LunList& l, MeskDiskInfo& d) {
                EXPECT_EQ(l.size(), lunCount) << "the disk query lacks the LUN list";
                EXPECT_TRUE(d.name.empty() && d.meskUuid.empty() && d.formatVersion == 0)
                    << "the disk query got a used record";
                d.meskUuid = ZuvCtl::Mesk::MeskUtil::MeskUuidToString(uuid);
                d.name = "name-" + d.meskUuid;
                d.deduplication = d.meskUuid[0] == '5';
            }));
    }

    std::shared_ptr<Output> List(const std::map<std::string, std::string>& filters) {
        auto input = Input::New();
        for (const auto& filter : filters) input->SetParameter(filter.first, filter.second);
        return Run(*StorageList::New(), input);
    }

    static std::vector<std::string> Listed(const Output& output) {
        std::vector<std::string> uuids;
        for (const auto& row : ListElements(output.GetRootObject())) {
            uuids.push_back(TextField(row, "MESK UUID"));
        }
        return uuids;
    }
};

TEST_F(StorageListTest, FiltersByNonEmptyValueAndOnlyThroughTheLuns) {
    struct Case {
        std::map<std::string, std::string> filters;
        std::vector<std::string> listed;
        std::vector<std::string> errors;
        int serviceQueries;  // the service's list is asked for even with a filter
    };
    const std::vector<Case> cases = {
        {{}, {kA, kB, kC}, {}, 1},
        {{{"device", ""}, {"uuid", ""}}, {kA, kB, kC}, {}, 1},
        {{{"device", "mpx.b"}}, {kB}, {}, 1},
        {{{"device", "MPX.B"}}, {}, {"Unable to find device with name: MPX.B"}, 1},
        {{{"uuid", kA}}, {kA}, {}, 1},
        // kC is held by the service but has no LUN.
        {{{"uuid", kC}}, {}, {"Unable to find device with uuid: " + kC}, 1},
        {{{"uuid", "not-a-uuid"}}, {}, {"Unable to list devices: bad uuid"}, 0},
    };
    SetHost({{"mpx.b", kB}, {"mpx.a", kA}}, {kC, kB});
    ON_CALL(host, StringToMeskUuid("not-a-uuid")).WillByDefault(Fail("bad uuid"));
    for (const auto& c : cases) {
        SCOPED_TRACE(::testing::PrintToString(c.filters));
        EXPECT_CALL(host, GetMeskDisks(_)).Times(1);
        EXPECT_CALL(info, GetMeskDiskUuids(_)).Times(c.serviceQueries);
        EXPECT_CALL(info, GetDiskInfo(_, _, _)).Times(int(c.listed.size()));
        auto output = List(c.filters);
        EXPECT_EQ(Listed(*output), c.listed);
        EXPECT_EQ(Errors(*output), c.errors);
        EXPECT_TRUE(output->IsComplete());
        ::testing::Mock::VerifyAndClearExpectations(&info);
        ::testing::Mock::VerifyAndClearExpectations(&host);
    }
}

TEST_F(StorageListTest, BothFiltersAreRefusedBeforeTheHostIsAsked) {
    EXPECT_CALL(host, GetMeskDisks(_)).Times(0);
    auto output = List({{"device", "nowhere"}, {"uuid", kA}});
    EXPECT_EQ(Errors(*output),
              std::vector<std::string>{"Only one of --device or --uuid can be specified."});
    EXPECT_EQ(output->GetRootObject(), nullptr);
    EXPECT_FALSE(output->IsComplete());
}

TEST_F(StorageListTest, MergesLunsAndServiceInByteOrderOnce) {
    SetHost({{"c", kC}, {"a", kA}, {"c2", kC}}, {kB, kA, kC, kB});
    EXPECT_CALL(info, GetDiskInfo(_, _, _)).Times(3);
    auto output = List({});
    EXPECT_THAT(Listed(*output), ElementsAreArray({kA, kB, kC}));
    EXPECT_TRUE(Errors(*output).empty());
    for (const auto& row : ListElements(output->GetRootObject())) {
        EXPECT_EQ(TextField(row, "Display Name"), TextField(row, "Device"));
        EXPECT_EQ(MeskTest::BoolField(row, "Compression"),
                  MeskTest::BoolField(row, "Deduplication"));
    }
}

TEST(StorageListVersion, ShowsKnownCodesAndUnknownForTheRest) {
    const std::map<int32_t, std::string> table = {{0, "1"},         {1, "<Unknown>"}, {2, "2"},
                                                  {3, "2.5"},       {4, "3"},         {5, "5"},
                                                  {6, "<Unknown>"}, {-1, "<Unknown>"}};
    StorageList list;
    for (const auto& entry : table) {
        EXPECT_EQ(list.MarshalVersion(entry.first)->GetValue(), entry.second) << entry.first;
    }
}

TEST_F(StorageListTest, FailureOnTheThirdOfFiveDisksKeepsTheFirstTwoAndCompletes) {
    const std::string d = "d0000000-0000-0000-0000-000000000004";
    const std::string e = "e0000000-0000-0000-0000-000000000005";
    SetHost({{"a", kA}, {"b", kB}, {"c", kC}, {"d", d}, {"e", e}}, {});
    EXPECT_CALL(info, GetDiskInfo(_, _, _)).Times(::testing::AnyNumber());
    EXPECT_CALL(info, GetDiskInfo(UuidOf(kC), _, _)).WillOnce(Fail("disk gone"));
    EXPECT_CALL(info, GetDiskInfo(UuidOf(d), _, _)).Times(0);
    auto output = List({});
    EXPECT_THAT(Listed(*output), ElementsAreArray({kA, kB}));
    EXPECT_EQ(Errors(*output), std::vector<std::string>{"Unable to list devices: disk gone"});
    EXPECT_TRUE(output->IsComplete());
}

}  // namespace
}  // namespace MeskNamespace
}  // namespace OrvaneCli
