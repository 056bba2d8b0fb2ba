/** @file Texts in fields. */
#include "host/wbem/FieldText.h"

#include <gtest/gtest.h>

namespace marlo::test {
namespace {

TEST(PercentEncoding, IsRead) {
    EXPECT_EQ(wbem::percentDecoded("root%2Fcimv2%3aC.K=%22%c3%A4%22"), "root/cimv2:C.K=\"\xC3\xA4\"");
    EXPECT_EQ(wbem::percentDecoded("plain+text"), "plain+text");
    for (const char* broken : {"%", "%2", "%2g", "%%", "a%f"}) {
        EXPECT_EQ(wbem::percentDecoded(broken), std::nullopt) << broken;
    }
}

TEST(PercentEncoding, KeepsAFieldToOneLineOfAscii) {
    EXPECT_EQ(wbem::percentEncoded("100 % of\r\nCIMError: \xC3\xA4\x7F"), "100 %25 of%0D%0ACIMError: %C3%A4%7F");
}

TEST(PercentEncoding, ReadsWhatItWrites) {
    std::string all;
    for (int byte = 0; byte < 256; ++byte) {
        all += static_cast<char>(byte);
    }
    EXPECT_EQ(wbem::percentDecoded(wbem::percentEncoded(all)), all);
}

} // namespace
} // namespace marlo::test
