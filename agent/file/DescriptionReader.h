/**
 * @file
 * From the TOML of a tree file to what it describes.
 *
 * For source files only: it brings the whole TOML library with it.
 */
#pragma once

#include "agent/config/TomlReader.h"
#include "agent/file/DocumentParts.h"
#include "agent/file/TreeBuilder.h"
#include "agent/hardware/Inventory.h"

#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace Orv::Agent {

/** What a description says. */
struct DescribedHost {
    std::shared_ptr<const Tree> tree; ///< with a port per adapter when the description has no hardware
    HardwareInventory hardware;
    bool saysHardware = false; ///< the description has a port or a card of its own
};

/** Reads one description. */
class DescriptionReader {
  public:
    /** Throws std::runtime_error as readTreeFile does. */
    static DescribedHost read(std::string_view text, const std::string& file);

  private:
    /** The card that a port names, to be looked for when all cards are known. */
    struct CardReference {
        std::string card;
        std::size_t line;
    };

    explicit DescriptionReader(const std::string& file) : _file(file) {}

    bool readInParts(const std::vector<DocumentPart>& parts);
    void readDocument(toml::table& document);
    void readHost(TomlReader& document);
    void readAdapter(toml::table& table);
    void readPort(toml::table& table);
    void readCard(toml::table& table);
    void checkCards() const;
    DescribedHost result();

    const std::string& _file;
    std::size_t _firstLine = 1; ///< of the part that is being read
    TreeBuilder _builder;
    HardwareInventory _hardware;
    std::vector<CardReference> _cardReferences;
    bool _saysHardware = false;
};

} // namespace Orv::Agent
