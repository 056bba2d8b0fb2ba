/**
 * @file
 * Which provider serves what: the registration files.
 */
#pragma once

#include "host/schema/Schema.h"

#include <string>
#include <vector>

namespace marlo {

/** The management interfaces that a provider may have. */
enum class ProviderKind { instance, method, indication, association, property };

/** One provider of one library. */
struct Registration {
    std::string name; ///< the prefix of the factories' symbols
    std::vector<ProviderKind> kinds;
    std::vector<std::string> nameSpaces; ///< as the schema spells them
    std::vector<std::string> classes;    ///< as the schema spells them; each is in every one of the namespaces
    std::string library;                 ///< with its directory
    std::string file;                    ///< where it is registered
    int line = 0;
};

/**
 * Reads the `*.toml` files of directories, one directory after the other, in each in the order of their names. A
 * relative library lies beside the file that names it or else in `libraryDirectory`. Throws std::runtime_error
 * "FILE:LINE: KEY: REASON" for what is wrong, and for a class of which two providers serve the same kind in the same
 * namespace.
 */
std::vector<Registration> readRegistrations(const std::vector<std::string>& directories,
                                            const std::string& libraryDirectory, const Schema& schema);

} // namespace marlo
