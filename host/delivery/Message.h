/**
 * @file
 * What is sent to a listener, and what its answer means (DSP0200, ExportIndication).
 */
#pragma once

#include "host/delivery/Url.h"
#include "host/model/Instance.h"

#include <cstdint>
#include <string>
#include <string_view>

namespace marlo::delivery {

/** The export message of an indication but for its place in a sequence, which each destination has its own of. */
std::string exportMessage(const std::string& messageId, const Instance& indication);

/** The message with SequenceContext and SequenceNumber (CIM_Indication). */
std::string inSequence(std::string_view message, std::string_view context, std::int64_t number);

/**
 * Tells the listener at a destination that `count` indications were lost; `first` and `last` are the numbers of the
 * first and the last of them.
 */
Instance lossNotice(std::uint64_t count, std::int64_t first, std::int64_t last, std::int64_t now);

/** The head of the request, from the request line to the empty line, for a body of a length. */
std::string requestHead(const Url& url, std::size_t bodyBytes);

/**
 * Why an answer is none that says that the indication has arrived; empty: it has. That takes status 200, and no ERROR
 * in the body; a listener may leave the body out. `cimError` is the field CIMError, where there is one.
 */
std::string problemOf(unsigned status, std::string_view cimError, std::string_view body);

} // namespace marlo::delivery
