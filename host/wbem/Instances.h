/**
 * @file
 * How instances go out.
 */
#pragma once

#include "host/cimxml/Writer.h"
#include "host/wbem/Operation.h"

namespace marlo::wbem {

/** Writes the instances of one answer to it. */
class InstanceOutput {
  public:
    /** `call` outlives this. */
    InstanceOutput(Call& call, cimxml::Wrap wrap, const cimxml::Form& form) : _call(call), _wrap(wrap), _form(form) {}

    void write(const Instance& instance);

  private:
    Call& _call;
    cimxml::Wrap _wrap;
    cimxml::Form _form;
    std::string _lastName; ///< class of the last instance and its definition: most of an answer are of one class
    const Class* _lastClass = nullptr;
};

/** The form that IncludeQualifiers (by default false) and IncludeClassOrigin ask for. */
cimxml::Form readForm(const Arguments& arguments);

/**
 * The property list without the names that neither the class nor one derived from it has: such names ask for nothing,
 * and are no error where properties are read (DSP0200).
 */
PropertyList readProperties(const Call& call, const std::string& className);

/** Leaves the properties of one class: what DeepInheritance=false leaves of instances of its subclasses. */
void cutToClass(const Class& definition, Instance& instance);

/** Leaves the properties of a list; all where there is none. */
void cutToList(const PropertyList& properties, Instance& instance);

} // namespace marlo::wbem
