/**
 * @file
 * Taking back the steps of a change that failed.
 */
#pragma once

#include <algorithm>
#include <exception>
#include <functional>
#include <string>
#include <utility>
#include <vector>

namespace Orv::Agent::Linux {

/** Steps that lead back, in the order in which those that lead forth were made. */
class Undo {
  public:
    void add(std::function<void()> step) { _steps.push_back(std::move(step)); }

    /**
     * Runs all steps, the last first; none keeps the others from being run. Returns the reasons of those that failed,
     * as the continuation of a sentence; nothing when all went well.
     */
    std::string run() {
        std::string failures;
        std::for_each(_steps.rbegin(), _steps.rend(), [&failures](const std::function<void()>& step) {
            try {
                step();
            } catch (const std::exception& failure) {
                failures += "; and what was there before could not be put back: ";
                failures += failure.what();
            }
        });
        _steps.clear();
        return failures;
    }

  private:
    std::vector<std::function<void()>> _steps;
};

} // namespace Orv::Agent::Linux
