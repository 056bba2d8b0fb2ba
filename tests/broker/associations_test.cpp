/** @file Associations, followed through the instances of whoever serves them. */
#include "tests/broker/BuiltIns.h"

#include <algorithm>
#include <atomic>
#include <thread>

namespace marlo::test {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::UnorderedElementsAre;

class AssociationsOfNodes : public BuiltIns {};

const std::string disk = "root/test:Test_Disk.Id=\"d\"";

TEST_F(AssociationsOfNodes, AssociatorNamesAreAtTheOtherEndsEachOnce) {
    fill();
    ASSERT_TRUE(manager->associatorNames(pathOf("root/test:Test_Box.Id=\"one\""), {}, takingPaths()).ok());
    EXPECT_THAT(paths, UnorderedElementsAre(disk, "root/test:Test_Disk.Id=\"lost\""));
    ASSERT_TRUE(manager->associatorNames(pathOf(disk), {}, takingPaths()).ok());
    EXPECT_THAT(paths, UnorderedElementsAre("root/test:Test_Box.Id=\"one\"", "root/test:Test_Crate.Id=\"c\"", disk));
}

TEST_F(AssociationsOfNodes, AssociationFiltersHoldTogether) {
    fill();
    const auto names = [this](const AssociationFilter& filter) {
        const Status status = manager->associatorNames(pathOf(disk), filter, takingPaths());
        EXPECT_TRUE(status.ok()) << status.message;
        std::sort(paths.begin(), paths.end());
        return paths;
    };
    const std::string one = "root/test:Test_Box.Id=\"one\"";
    const std::string crate = "root/test:Test_Crate.Id=\"c\"";
    EXPECT_EQ(names({"test_holds", "", "", ""}), (Names{one, crate}));
    EXPECT_EQ(names({"Test_Mirrors", "", "", ""}), (Names{disk}));
    EXPECT_EQ(names({"Test_Link", "Test_Crate", "", ""}), (Names{crate}));
    EXPECT_EQ(names({"", "Test_Box", "", ""}), (Names{one, crate}));
    EXPECT_EQ(names({"", "Test_Disk", "part", ""}), (Names{disk}));
    EXPECT_EQ(names({"Test_Holds", "", "Whole", ""}), Names{});
    EXPECT_EQ(names({"Test_Holds", "", "Part", "WHOLE"}), (Names{one, crate}));
    EXPECT_EQ(names({"Test_Holds", "", "", "Part"}), Names{});
    EXPECT_EQ(names({"Test_Unserved2", "", "", ""}), Names{});
}

TEST_F(AssociationsOfNodes, AssociatorsAreTheInstancesThatExist) {
    fill();
    const Status status =
        manager->associators(pathOf("root/test:Test_Box.Id=\"one\""), {}, Names{"note", "Colour"}, taking());
    ASSERT_TRUE(status.ok()) << status.message;
    EXPECT_THAT(foundPaths(), ElementsAre(disk));
    EXPECT_EQ(found[0].properties, (std::vector<NamedValue>{{"Note", Value::string("turns")}}));
}

TEST_F(AssociationsOfNodes, AssociatorsThatCannotBeHadAreLeftOutAndLoggedOnce) {
    fill();
    for (int i = 0; i < 2; ++i) {
        ASSERT_TRUE(manager->associators(pathOf("root/test:Test_Box.Id=\"two\""), {}, std::nullopt, taking()).ok());
        EXPECT_THAT(foundPaths(), IsEmpty());
    }
    EXPECT_THAT(site.lines(), ElementsAre(HasSubstr("root/interop:Test_Far.Id=\"f\": no provider serves")));
}

TEST_F(AssociationsOfNodes, ReferencesAreTheAssociationsThemselves) {
    fill();
    ASSERT_TRUE(manager->references(pathOf(disk), {"", "", "Part", ""}, Names{"Whole"}, taking()).ok());
    ASSERT_EQ(found.size(), 3U);
    EXPECT_EQ(found[0].properties, (std::vector<NamedValue>{{"Whole", reference("root/test:Test_Box.Id=\"one\"")}}));
    ASSERT_TRUE(manager->referenceNames(pathOf(disk), {"Test_Mirrors", "", "", ""}, takingPaths()).ok());
    EXPECT_THAT(paths, ElementsAre("root/test:Test_Mirrors.Whole=\"root/test:Test_Disk.Id=\\\"d\\\"\","
                                   "Part=\"root/test:Test_Disk.Id=\\\"d\\\"\""));
}

TEST_F(AssociationsOfNodes, AssociationsNeedNoInstanceAtTheStart) {
    fill();
    ASSERT_TRUE(manager->referenceNames(pathOf("root/test:Test_Disk.Id=\"lost\""), {}, takingPaths()).ok());
    EXPECT_EQ(paths.size(), 1U);
    ASSERT_TRUE(
        manager->associators(pathOf("root/test:Test_Thing.Id=\"x\",Number=1"), {}, std::nullopt, taking()).ok());
    EXPECT_THAT(found, IsEmpty());
}

TEST_F(AssociationsOfNodes, AssociationsRefuseWhatTheSchemaDoesNotHave) {
    const auto names = [this](const std::string& path, const AssociationFilter& filter) {
        return manager->associatorNames(pathOf(path), filter, takingPaths());
    };
    expect(names("root/test:Test_None.Id=\"x\"", {}), CMPI_RC_ERR_INVALID_CLASS, "Test_None");
    expect(names("root/test:Test_Disk", {}), CMPI_RC_ERR_INVALID_PARAMETER, "lacks the key Id");
    expect(names(disk, {"Test_None", "", "", ""}), CMPI_RC_ERR_INVALID_PARAMETER, "there is no class 'Test_None'");
    expect(names(disk, {"Test_Box", "", "", ""}), CMPI_RC_ERR_INVALID_PARAMETER, "not a class of associations");
    expect(names(disk, {"", "Test_None", "", ""}), CMPI_RC_ERR_INVALID_PARAMETER, "there is no class 'Test_None'");
    expect(names(disk, {"", "", "Slot", ""}), CMPI_RC_ERR_INVALID_PARAMETER, "no association has a reference 'Slot'");
    expect(names(disk, {"Test_Holds", "", "", "Left"}), CMPI_RC_ERR_INVALID_PARAMETER, "a reference 'Left'");
}

TEST_F(AssociationsOfNodes, FailureOfAnAssociationsServantIsAnswered) {
    fill();
    shelf->failure = {CMPI_RC_ERR_ACCESS_DENIED, "not today", {}};
    expect(manager->referenceNames(pathOf(disk), {}, takingPaths()), CMPI_RC_ERR_ACCESS_DENIED, "not today");
    shelf->failure = {CMPI_RC_ERR_NOT_SUPPORTED, "never", {}};
    EXPECT_TRUE(manager->referenceNames(pathOf(disk), {}, takingPaths()).ok());
}

TEST_F(AssociationsOfNodes, ServeManyThreads) {
    fill();
    std::vector<std::thread> threads;
    std::atomic<int> wrong{0};
    for (int i = 0; i < 4; ++i) {
        threads.emplace_back([&] {
            for (int round = 0; round < 20; ++round) {
                int count = 0;
                const auto counting = [&count](ObjectPath&&) { ++count; };
                const bool ok = manager->associatorNames(pathOf(disk), {}, counting).ok() &&
                                manager->enumerateInstanceNames("root/test", "Test_Node", counting).ok();
                wrong += ok && count == 7 ? 0 : 1;
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(wrong, 0);
}

} // namespace
} // namespace marlo::test
