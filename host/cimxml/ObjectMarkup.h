/**
 * @file
 * Instances as DSP0201's elements.
 */
#pragma once

#include "host/cimxml/Writer.h"

#include <string>
#include <string_view>
#include <vector>

namespace marlo::cimxml {

/** An INSTANCE of which no definition is at hand. */
void appendInstance(std::string& out, const Instance& instance);

/** Writes the instances of one class: what is the same for all of them is prepared once. */
class InstanceMarkup {
  public:
    /** `definition` must outlive this. */
    InstanceMarkup(const Class& definition, const Form& form);

    [[nodiscard]] bool isOf(const Class* definition, const Form& form) const {
        return &_definition == definition && _form == form;
    }

    void append(std::string& out, const Instance& instance) const;

  private:
    struct Prepared {
        const Property* property = nullptr;
        std::string begin; ///< from `<PROPERTY` to where the value stands
    };

    /** The property of a name, looked for from a place on, which becomes the one behind it. */
    const Prepared* find(std::string_view name, std::size_t& place) const;

    const Class& _definition;
    Form _form;
    std::vector<Prepared> _properties;
    std::string _qualifiers; ///< of the class
};

} // namespace marlo::cimxml
