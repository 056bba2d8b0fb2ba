/**
 * @file
 * Answers to intrinsic methods (DSP0200, DSP0201) as a client reads them.
 */
#pragma once

#include "host/cimxml/Message.h"

#include <string>
#include <string_view>
#include <vector>

namespace marlo::cimxml {

/** What an IMETHODRESPONSE holds: an error, or objects. */
struct IntrinsicAnswer {
    unsigned code = 0; ///< of CIM; 0 where there is no ERROR
    std::string description;
    std::vector<Instance> instances; ///< VALUE.NAMEDINSTANCE, with keys in their paths
    std::vector<ObjectPath> paths;   ///< INSTANCENAME
};

/** Throws MessageError for what is no such answer, or holds other objects. Any thread. */
IntrinsicAnswer readIntrinsicAnswer(std::string_view text, const Limits& limits);

} // namespace marlo::cimxml
