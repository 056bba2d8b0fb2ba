/**
 * @file
 * Elements that hold instances and values.
 */
#pragma once

#include "host/cimxml/Document.h"
#include "host/model/Instance.h"

#include <memory>
#include <optional>
#include <string>

namespace marlo::cimxml {

/** Limits, and how deep within embedded objects a reader is. */
struct Within {
    const Limits& limits;
    std::size_t embedded = 0;
};

/** An INSTANCE; its path has the class name only. All of these throw MessageError for what DSP0201 does not allow. */
Instance readInstance(const Node& node, const Within& within);

/** A VALUE.NAMEDINSTANCE: keys are in the path. */
Instance readNamedInstance(const Node& node, const Within& within);

/** The INSTANCE that a text is the document of. */
std::shared_ptr<const Instance> readEmbedded(std::string_view text, const Within& within);

/** The embedded objects of a VALUE, which may be a NULL, or of a VALUE.ARRAY. */
Value readEmbeddedValue(const Node& node, const Within& within);

/** The texts of a VALUE.ARRAY; VALUE.NULL is none. */
std::vector<std::optional<std::string>> readTexts(const Node& node);

/** A VALUE or VALUE.ARRAY as a value of a type without CMPI_ARRAY; a text that is none stays one. */
Value readTyped(const Node& node, CMPIType type);

/** Whether EmbeddedObject says that texts are documents. */
bool isEmbedded(const Node& node);

/** The child behind all QUALIFIERs, which must be an `element`; nothing where there is none. */
std::optional<Node> findValue(const Node& node, std::string_view element);

} // namespace marlo::cimxml
