/**
 * @file
 * Tests that want something of the machine that not every machine has.
 */
#pragma once

#include <cstdlib>
#include <string>

#include <gtest/gtest.h>

/**
 * Goes on where `whyNot`, a std::string, is empty: elsewhere the test is skipped for that reason, or fails under CI,
 * where everything is expected to be there.
 */
#define GO_ON_UNLESS(whyNot)                                                                                         \
    if (const std::string why = (whyNot); !why.empty()) {                                                            \
        if (std::getenv("CI") != nullptr) {                                                                          \
            FAIL() << why;                                                                                           \
        }                                                                                                            \
        GTEST_SKIP() << why;                                                                                         \
    }                                                                                                                \
    static_assert(true, "a semicolon follows")
