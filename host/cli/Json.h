/**
 * @file
 * CIM objects as JSON.
 */
#pragma once

#include "host/cli/ChangeReport.h"
#include "host/cli/Output.h"
#include "host/model/Instance.h"
#include "host/schema/Schema.h"

#include <string>

namespace marlo::cli {

/**
 * `{"path": "...", "class": "...", "properties": {"Name": value, ...}}` on one line. Integers and reals are numbers,
 * texts, date-times, characters and references strings, embedded instances objects of this shape, NULL is null.
 */
std::string toJson(const Instance& instance);

/** `{"path": "...", "class": "...", "keys": {"Name": value, ...}}` on one line. */
std::string toJson(const ObjectPath& path);

/** `{"class": "...", "superclass": "..." or null, "abstract": bool, "keys": ["Name", ...]}` on one line. */
std::string toJson(const Class& schemaClass);

/**
 * `{"calls": [...], "changes": [...]}` on one line. A call is `{"call": "...", "returned": value, "out": {...}}`,
 * without the latter two for a modification, or `{"call": "...", "error": {"code": n, "name": "CIM_ERR_...",
 * "message": "..."}}`; either may have `"reported": ["..."]` beside. A change is
 * `{"adapter": "...", "property": "...", "before": value, "after": value}`.
 */
std::string toJson(const ChangeReport& report);

/** A JSON array that is written element by element, and not at all when nothing is added and it is not closed. */
class JsonArray {
  public:
    explicit JsonArray(Output& output) : _output(output) {}

    void add(const std::string& element) {
        _output.write(_isOpen ? ",\n" : "[\n");
        _output.write(element);
        _isOpen = true;
    }

    /** Ends the array; one that is empty because its operation failed is left unwritten. */
    void close(bool answered) {
        if (_isOpen || answered) {
            _output.write(_isOpen ? "\n]\n" : "[]\n");
        }
    }

  private:
    Output& _output;
    bool _isOpen = false;
};

} // namespace marlo::cli
