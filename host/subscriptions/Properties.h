/**
 * @file
 * Properties of instances, read and set by name.
 */
#pragma once

#include "host/model/Instance.h"

#include <chrono>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace marlo::subscriptions {

using Time = std::chrono::system_clock::time_point;

/** Of a text; empty where there is none. */
std::string textOf(const Instance& instance, std::string_view name);

/** Of an unsigned integer or a boolean; nothing where there is none. */
std::optional<std::uint64_t> numberOf(const Instance& instance, std::string_view name);

/** Of an array of texts; NULL elements are left out. */
std::vector<std::string> textsOf(const Instance& instance, std::string_view name);

/** Of a reference; null where there is none. */
const ObjectPath* referenceOf(const Instance& instance, std::string_view name);

/** Puts a value in the place of a former one. */
void set(Instance& instance, const std::string& name, Value value);

Value textArray(const std::vector<std::string>& texts);
Value reference(ObjectPath path);
Value number16(std::uint64_t number);
Value number64(std::uint64_t number);

/** A date-time; one that cannot be written (a clock beyond the year 9999) is NULL. */
Value timeValue(Time time);

} // namespace marlo::subscriptions
