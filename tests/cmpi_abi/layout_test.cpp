// The header definitions as C++20 sees them, against the same layout and against objects that C made.
#include "tests/cmpi_abi/layout.h"
#include "tests/cmpi_abi/layout_c.h"

#include <gtest/gtest.h>

TEST(CmpiAbi, StatusReturnedFromCIsReadInCpp) {
    const CMPIStatus status = statusReturnedInC();
    EXPECT_EQ(status.rc, CMPI_RC_ERR_NOT_FOUND);
    EXPECT_EQ(status.msg, nullptr);
}

TEST(CmpiAbi, TableInitialisedInCIsCalledFromCpp) {
    const CMPIInstanceMIFT* table = tableBuiltInC();
    EXPECT_EQ(table->ftVersion, 200);
    EXPECT_EQ(table->miVersion, 200);
    EXPECT_STREQ(table->miName, "instanceBuiltInC");
    CMPIInstanceMI mi{nullptr, table};
    EXPECT_EQ(mi.ft->cleanup(&mi, nullptr, 1).rc, CMPI_RC_OK);
    EXPECT_EQ(table->execQuery, nullptr);
}

TEST(CmpiAbi, ValueMembersStartAtTheBeginningOfTheUnion) {
    CMPIValue value{};
    EXPECT_EQ(static_cast<const void*>(&value.uint16), static_cast<const void*>(&value));
    EXPECT_EQ(static_cast<const void*>(&value.string), static_cast<const void*>(&value));
    EXPECT_EQ(static_cast<const void*>(&value.dataPtr.ptr), static_cast<const void*>(&value));
}

TEST(CmpiAbi, SetStatusLeavesANullStatusAlone) {
    CMPIStatus* none = nullptr;
    CMSetStatus(none, CMPI_RC_ERR_FAILED);
    CMPIStatus status{CMPI_RC_OK, reinterpret_cast<CMPIString*>(&status)};
    CMPIStatus* some = &status;
    CMSetStatus(some, CMPI_RC_ERR_FAILED);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_FAILED);
    EXPECT_EQ(status.msg, nullptr);
}
