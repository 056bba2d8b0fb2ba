/**
 * @file
 * The commands, each a CIM operation or two and the printing of the answer.
 */
#pragma once

#include "host/cimom/ObjectManager.h"
#include "host/cli/Options.h"
#include "host/cli/Output.h"

namespace marlo::cli {

enum ExitCode : int { Answered = 0, Failed = 1, WrongUsage = 2 };

/**
 * Runs the command. What it answers goes to the output, as it comes; what went wrong to standard error. Throws
 * UsageError, OutputError.
 */
ExitCode run(ObjectManager& manager, const Options& given, Output& output);

/** Prints how an operation failed, and what was logged while it was answered; Answered when there is nothing to say.
 */
ExitCode report(const Status& status);

/** Throws UsageError for a name that no property of the class has, nor of a class that derives from it. */
void requireProperties(const Schema& schema, const std::string& nameSpace, const std::string& className,
                       const std::vector<std::string>& names);

/** Adds those of the named properties that the instance's class has and the instance has not, as NULL. */
void addMissing(const Schema& schema, Instance& instance, const std::vector<std::string>& names);

/** Brings properties into the order of their class. */
void orderBySchema(const Schema& schema, Instance& instance);

} // namespace marlo::cli
