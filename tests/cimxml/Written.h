/**
 * @file
 * What a writer writes.
 */
#pragma once

#include "host/cimxml/Writer.h"

#include <string>
#include <string_view>

namespace marlo::test {

/** Everything that comes of what `write` does with a writer of the host "host.example:5989". */
template <typename Write>
std::string written(Write write) {
    std::string document;
    cimxml::Writer writer([&document](std::string_view piece) { document += piece; }, "host.example:5989");
    write(writer);
    writer.finish();
    return document;
}

} // namespace marlo::test
