#include "agent/hardware/LinkModes.h"

#include <initializer_list>

#include <gtest/gtest.h>
#include <linux/ethtool.h>

namespace Orv::Agent::Hardware {
namespace {

std::vector<std::uint32_t> bits(std::initializer_list<unsigned> set) {
    std::vector<std::uint32_t> words(4);
    for (const unsigned bit : set) {
        words[bit / 32] |= 1U << (bit % 32);
    }
    return words;
}

LinkSettings settings(std::uint32_t speed, std::uint8_t port, std::initializer_list<unsigned> supported) {
    return {speed, true, true, bits(supported), port};
}

TEST(FastestMode, IsTheFastestOfAll) {
    EXPECT_EQ(fastestMode(bits({ETHTOOL_LINK_MODE_10baseT_Half_BIT, ETHTOOL_LINK_MODE_1000baseT_Full_BIT,
                                ETHTOOL_LINK_MODE_100baseT_Full_BIT})),
              1000U);
    EXPECT_EQ(fastestMode(bits({ETHTOOL_LINK_MODE_25000baseCR_Full_BIT, ETHTOOL_LINK_MODE_10000baseSR_Full_BIT})),
              25000U);
}

struct ModeSpeed {
    unsigned bit;
    std::uint32_t speed;
};

class SpeedOfMode : public testing::TestWithParam<ModeSpeed> {};

TEST_P(SpeedOfMode, IsThatOfItsName) {
    EXPECT_EQ(fastestMode(bits({GetParam().bit})), GetParam().speed);
}

// The kernel's names say the speed, so every name of the headers is checked against the table.
INSTANTIATE_TEST_SUITE_P(
    Modes, SpeedOfMode,
    testing::Values(
        ModeSpeed{ETHTOOL_LINK_MODE_10baseT_Half_BIT, 10}, ModeSpeed{ETHTOOL_LINK_MODE_10baseT_Full_BIT, 10},
        ModeSpeed{ETHTOOL_LINK_MODE_100baseT_Half_BIT, 100}, ModeSpeed{ETHTOOL_LINK_MODE_100baseT_Full_BIT, 100},
        ModeSpeed{ETHTOOL_LINK_MODE_1000baseT_Half_BIT, 1000}, ModeSpeed{ETHTOOL_LINK_MODE_1000baseT_Full_BIT, 1000},
        ModeSpeed{ETHTOOL_LINK_MODE_10000baseT_Full_BIT, 10000},
        ModeSpeed{ETHTOOL_LINK_MODE_2500baseX_Full_BIT, 2500}, ModeSpeed{ETHTOOL_LINK_MODE_1000baseKX_Full_BIT, 1000},
        ModeSpeed{ETHTOOL_LINK_MODE_10000baseKX4_Full_BIT, 10000},
        ModeSpeed{ETHTOOL_LINK_MODE_10000baseKR_Full_BIT, 10000},
        ModeSpeed{ETHTOOL_LINK_MODE_10000baseR_FEC_BIT, 10000},
        ModeSpeed{ETHTOOL_LINK_MODE_20000baseMLD2_Full_BIT, 20000},
        ModeSpeed{ETHTOOL_LINK_MODE_20000baseKR2_Full_BIT, 20000},
        ModeSpeed{ETHTOOL_LINK_MODE_40000baseKR4_Full_BIT, 40000},
        ModeSpeed{ETHTOOL_LINK_MODE_40000baseLR4_Full_BIT, 40000},
        ModeSpeed{ETHTOOL_LINK_MODE_56000baseKR4_Full_BIT, 56000},
        ModeSpeed{ETHTOOL_LINK_MODE_56000baseLR4_Full_BIT, 56000},
        ModeSpeed{ETHTOOL_LINK_MODE_25000baseCR_Full_BIT, 25000},
        ModeSpeed{ETHTOOL_LINK_MODE_25000baseSR_Full_BIT, 25000},
        ModeSpeed{ETHTOOL_LINK_MODE_50000baseCR2_Full_BIT, 50000},
        ModeSpeed{ETHTOOL_LINK_MODE_50000baseKR2_Full_BIT, 50000},
        ModeSpeed{ETHTOOL_LINK_MODE_100000baseKR4_Full_BIT, 100000},
        ModeSpeed{ETHTOOL_LINK_MODE_100000baseLR4_ER4_Full_BIT, 100000},
        ModeSpeed{ETHTOOL_LINK_MODE_50000baseSR2_Full_BIT, 50000},
        ModeSpeed{ETHTOOL_LINK_MODE_1000baseX_Full_BIT, 1000},
        ModeSpeed{ETHTOOL_LINK_MODE_10000baseCR_Full_BIT, 10000},
        ModeSpeed{ETHTOOL_LINK_MODE_10000baseSR_Full_BIT, 10000},
        ModeSpeed{ETHTOOL_LINK_MODE_10000baseLR_Full_BIT, 10000},
        ModeSpeed{ETHTOOL_LINK_MODE_10000baseLRM_Full_BIT, 10000},
        ModeSpeed{ETHTOOL_LINK_MODE_10000baseER_Full_BIT, 10000},
        ModeSpeed{ETHTOOL_LINK_MODE_2500baseT_Full_BIT, 2500}, ModeSpeed{ETHTOOL_LINK_MODE_5000baseT_Full_BIT, 5000},
        ModeSpeed{ETHTOOL_LINK_MODE_50000baseKR_Full_BIT, 50000},
        ModeSpeed{ETHTOOL_LINK_MODE_50000baseDR_Full_BIT, 50000},
        ModeSpeed{ETHTOOL_LINK_MODE_100000baseKR2_Full_BIT, 100000},
        ModeSpeed{ETHTOOL_LINK_MODE_100000baseDR2_Full_BIT, 100000},
        ModeSpeed{ETHTOOL_LINK_MODE_200000baseKR4_Full_BIT, 200000},
        ModeSpeed{ETHTOOL_LINK_MODE_200000baseCR4_Full_BIT, 200000},
        ModeSpeed{ETHTOOL_LINK_MODE_100baseT1_Full_BIT, 100}, ModeSpeed{ETHTOOL_LINK_MODE_1000baseT1_Full_BIT, 1000},
        ModeSpeed{ETHTOOL_LINK_MODE_400000baseKR8_Full_BIT, 400000},
        ModeSpeed{ETHTOOL_LINK_MODE_400000baseCR8_Full_BIT, 400000},
        ModeSpeed{ETHTOOL_LINK_MODE_100000baseKR_Full_BIT, 100000},
        ModeSpeed{ETHTOOL_LINK_MODE_100000baseDR_Full_BIT, 100000},
        ModeSpeed{ETHTOOL_LINK_MODE_200000baseKR2_Full_BIT, 200000},
        ModeSpeed{ETHTOOL_LINK_MODE_200000baseCR2_Full_BIT, 200000},
        ModeSpeed{ETHTOOL_LINK_MODE_400000baseKR4_Full_BIT, 400000},
        ModeSpeed{ETHTOOL_LINK_MODE_400000baseCR4_Full_BIT, 400000},
        ModeSpeed{ETHTOOL_LINK_MODE_100baseFX_Half_BIT, 100}, ModeSpeed{ETHTOOL_LINK_MODE_100baseFX_Full_BIT, 100},
        ModeSpeed{ETHTOOL_LINK_MODE_10baseT1L_Full_BIT, 10},
        // newer than the headers: 800000baseCR8 and VR8, 10baseT1S, 200000baseCR, 400000baseCR2, 800000baseCR4,
        // 1600000baseCR8
        ModeSpeed{93, 800000}, ModeSpeed{98, 800000}, ModeSpeed{99, 10}, ModeSpeed{103, 200000},
        ModeSpeed{109, 400000}, ModeSpeed{115, 800000}, ModeSpeed{121, 1600000}));

class BitThatIsNoSpeed : public testing::TestWithParam<unsigned> {};

TEST_P(BitThatIsNoSpeed, HasNone) {
    EXPECT_FALSE(fastestMode(bits({GetParam()})));
}

INSTANTIATE_TEST_SUITE_P(Bits, BitThatIsNoSpeed,
                         testing::Values(ETHTOOL_LINK_MODE_Autoneg_BIT, ETHTOOL_LINK_MODE_TP_BIT,
                                         ETHTOOL_LINK_MODE_AUI_BIT, ETHTOOL_LINK_MODE_MII_BIT,
                                         ETHTOOL_LINK_MODE_FIBRE_BIT, ETHTOOL_LINK_MODE_BNC_BIT,
                                         ETHTOOL_LINK_MODE_Pause_BIT, ETHTOOL_LINK_MODE_Asym_Pause_BIT,
                                         ETHTOOL_LINK_MODE_Backplane_BIT, ETHTOOL_LINK_MODE_FEC_NONE_BIT,
                                         ETHTOOL_LINK_MODE_FEC_RS_BIT, ETHTOOL_LINK_MODE_FEC_BASER_BIT,
                                         ETHTOOL_LINK_MODE_FEC_LLRS_BIT, 127U));

TEST(FastestMode, OfAShortOrEmptyBitmapIsNone) {
    EXPECT_FALSE(fastestMode({}));
    const std::vector<std::uint32_t> oneWord{1U << ETHTOOL_LINK_MODE_1000baseT_Full_BIT};
    EXPECT_EQ(fastestMode(oneWord), 1000U);
}

TEST(KnownSpeed, IsNoneForTheKernelsUnknown) {
    EXPECT_FALSE(knownSpeed(0));
    EXPECT_FALSE(knownSpeed(0xffffffff));
    EXPECT_EQ(knownSpeed(1), 1U);
}

TEST(KnownDuplex, IsNoneForTheKernelsUnknown) {
    EXPECT_EQ(knownDuplex(DUPLEX_FULL), true);
    EXPECT_EQ(knownDuplex(DUPLEX_HALF), false);
    EXPECT_FALSE(knownDuplex(DUPLEX_UNKNOWN));
}

TEST(CanNegotiate, ComesFromTheSupportedModes) {
    LinkSettings link = settings(1000, PORT_TP, {ETHTOOL_LINK_MODE_1000baseT_Full_BIT});
    link.autonegotiation = false;
    EXPECT_EQ(canNegotiate(link), false);
    link.supported = bits({ETHTOOL_LINK_MODE_1000baseT_Full_BIT, ETHTOOL_LINK_MODE_Autoneg_BIT});
    EXPECT_EQ(canNegotiate(link), true);
}

TEST(CanNegotiate, IsUnknownWhenTheDriverListsNoModes) {
    LinkSettings link;
    link.autonegotiation = false;
    EXPECT_FALSE(canNegotiate(link));
    link.supported = bits({});
    EXPECT_FALSE(canNegotiate(link));
    link.autonegotiation = true;
    EXPECT_EQ(canNegotiate(link), true);
}

TEST(CimPortType, IsThatOfTheOnlyModeOfTheSpeed) {
    EXPECT_EQ(cimPortType(settings(1000, PORT_TP, {ETHTOOL_LINK_MODE_1000baseT_Full_BIT, 3})), 53);
    EXPECT_EQ(cimPortType(settings(100, PORT_TP, {ETHTOOL_LINK_MODE_1000baseT_Full_BIT, 3})), 52);
    EXPECT_EQ(cimPortType(settings(10, PORT_TP, {0, 1})), 50);
    EXPECT_EQ(cimPortType(settings(2500, PORT_TP, {ETHTOOL_LINK_MODE_2500baseT_Full_BIT})), 54);
    EXPECT_EQ(cimPortType(settings(10000, PORT_TP, {ETHTOOL_LINK_MODE_10000baseT_Full_BIT})), 55);
    EXPECT_EQ(cimPortType(settings(10000, PORT_FIBRE, {ETHTOOL_LINK_MODE_10000baseSR_Full_BIT})), 105);
}

TEST(CimPortType, IsUnknownWhenSeveralModesFit) {
    EXPECT_FALSE(cimPortType(settings(
        10000, PORT_FIBRE, {ETHTOOL_LINK_MODE_10000baseSR_Full_BIT, ETHTOOL_LINK_MODE_10000baseLR_Full_BIT})));
    EXPECT_FALSE(cimPortType(
        settings(1000, PORT_TP, {ETHTOOL_LINK_MODE_1000baseT_Full_BIT, ETHTOOL_LINK_MODE_1000baseX_Full_BIT})));
}

TEST(CimPortType, IsUnknownWhenTheConnectorDoesNotFit) {
    EXPECT_FALSE(cimPortType(settings(10000, PORT_FIBRE, {ETHTOOL_LINK_MODE_10000baseT_Full_BIT})));
}

TEST(CimPortType, IsUnknownForALinkWithoutModes) {
    EXPECT_FALSE(cimPortType(settings(10000, PORT_TP, {})));
}

TEST(CimPortType, IsUnknownWithoutASpeed) {
    LinkSettings link = settings(0, PORT_TP, {ETHTOOL_LINK_MODE_1000baseT_Full_BIT});
    link.speed.reset();
    EXPECT_FALSE(cimPortType(link));
}

} // namespace
} // namespace Orv::Agent::Hardware
