/**
 * @file
 * Extrinsic methods: those that classes have.
 */
#pragma once

#include "host/cimom/ObjectManager.h"
#include "host/cimxml/Message.h"
#include "host/wbem/Reply.h"

namespace marlo::wbem {

/**
 * Calls a method with arguments of the types that the schema gives its parameters, and writes what it gave back. The
 * reply is ended by the caller. Throws RequestError: 4 for an argument that is not of its parameter's type.
 */
Status callMethod(ObjectManager& manager, const cimxml::ExtrinsicCall& call, Reply& reply);

} // namespace marlo::wbem
