/**
 * @file
 * The built marlo, run as a user runs it.
 */
#pragma once

#include "tests/security/TemporaryDirectory.h"

#include <nlohmann/json.hpp>
#include <string>
#include <vector>

#include <gtest/gtest.h>

namespace marlo::test {

struct Outcome {
    int exitCode = -1; ///< 128 plus the signal where one ended the program
    std::string out;
    std::string err;
};

/** Runs a program; its standard output goes to `outputFile` where one is named. `environment` adds to this process's.
 */
Outcome runProgram(const std::vector<std::string>& arguments, const std::vector<std::string>& environment = {},
                   const std::string& outputFile = "", const std::string& directory = "");

/** A test with a directory of its own, in which a tree file describes a host with four adapters. */
class MarloTest : public testing::Test {
  protected:
    MarloTest();

    /** marlo with these arguments, on the described host. */
    [[nodiscard]] Outcome marlo(std::vector<std::string> arguments) const;
    /** The same, with --json; the test fails when the output is no JSON or the exit code is not 0. */
    [[nodiscard]] nlohmann::ordered_json marloJson(std::vector<std::string> arguments) const;

    [[nodiscard]] std::string path(const std::string& name) const { return _directory.file(name); }

    /** Writes a file below the test's directory; returns its path. */
    std::string write(const std::string& name, const std::string& text) const;

    [[nodiscard]] const std::string& tree() const { return _tree; }

    [[nodiscard]] std::string directory() const { return _directory.path().string(); }

  private:
    TemporaryDirectory _directory;
    std::string _tree;
};

/** The fixture provider's classes, in root/test, with schema, registrations and libraries of the test's own. */
class FixtureTest : public MarloTest {
  protected:
    FixtureTest();

    /** The class that these arguments ask for is one of the fixture's; -n and the directories are added. */
    [[nodiscard]] std::vector<std::string> onFixture(std::vector<std::string> arguments) const;

    void registerProvider(const std::string& file, const std::string& library, const std::string& provider,
                          const std::vector<std::string>& classes) const;
};

} // namespace marlo::test
