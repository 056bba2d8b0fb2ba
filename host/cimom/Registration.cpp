#include "host/cimom/Registration.h"

#include "agent/config/TextFile.h"
#include "agent/config/TomlReader.h"

#include <algorithm>
#include <array>
#include <filesystem>
#include <stdexcept>
#include <utility>

namespace marlo {

namespace {

using Orv::Agent::TomlReader;

constexpr std::array<std::pair<const char*, ProviderKind>, 5> kindNames{{
    {"instance", ProviderKind::instance},
    {"method", ProviderKind::method},
    {"indication", ProviderKind::indication},
    {"association", ProviderKind::association},
    {"property", ProviderKind::property},
}};

std::string knownKinds() {
    std::string text;
    for (const auto& [name, kind] : kindNames) {
        text += (text.empty() ? "" : ", ") + std::string(name);
    }
    return text;
}

const char* nameOf(ProviderKind kind) {
    return std::find_if(kindNames.begin(), kindNames.end(), [kind](const auto& e) { return e.second == kind; })
        ->first;
}

/** One file's registrations. */
class FileReader {
  public:
    FileReader(const std::string& file, const std::string& libraryDirectory, const Schema& schema)
        : _file(file), _libraryDirectory(libraryDirectory), _schema(schema) {}

    std::vector<Registration> read() {
        toml::table document = Orv::Agent::parseToml(Orv::Agent::readTextFile(_file).text, _file);
        TomlReader reader(document, _file, _noPrefix);
        const std::string library = requireText(reader, "library");
        const auto tables = reader.tables("provider");
        reader.refuseOtherKeys();
        if (tables.empty()) {
            reader.refuseKey("provider", "expected at least one [[provider]] table");
        }
        std::vector<Registration> registrations;
        for (toml::table* table : tables) {
            registrations.push_back(readProvider(*table));
            registrations.back().library = findLibrary(library);
        }
        return registrations;
    }

  private:
    /** With its directory; an absolute path stays what it is. */
    [[nodiscard]] std::string findLibrary(const std::string& library) const {
        const std::filesystem::path beside = std::filesystem::path(_file).parent_path() / library;
        std::error_code ignored;
        return (std::filesystem::exists(beside, ignored) ? beside
                                                         : std::filesystem::path(_libraryDirectory) / library)
            .string();
    }

    static std::string requireText(TomlReader& reader, std::string_view key) {
        const auto text = reader.text(key);
        if (!text || text->empty()) {
            reader.refuseKey(key, text ? "must not be empty" : "missing");
        }
        return *text;
    }

    static std::vector<std::string> requireTexts(TomlReader& reader, std::string_view key) {
        auto texts = reader.texts(key);
        if (!texts || texts->empty()) {
            reader.refuseKey(key, texts ? "must not be empty" : "missing");
        }
        return *std::move(texts);
    }

    Registration readProvider(toml::table& table) {
        TomlReader reader(table, _file, _providerPrefix);
        Registration registration;
        registration.file = _file;
        registration.line = static_cast<int>(table.source().begin.line);
        registration.name = readName(reader);
        registration.kinds = readKinds(reader);
        registration.nameSpaces = readNameSpaces(reader);
        registration.classes = readClasses(reader, registration.nameSpaces);
        reader.refuseOtherKeys();
        return registration;
    }

    static std::string readName(TomlReader& reader) {
        std::string name = requireText(reader, "name");
        const bool symbol = std::all_of(
            name.begin(), name.end(), [](unsigned char c) { return c == '_' || (c < 0x80 && std::isalnum(c) != 0); });
        if (!symbol) {
            reader.refuseKey("name", "'" + name + "' cannot be part of a symbol");
        }
        return name;
    }

    static std::vector<ProviderKind> readKinds(TomlReader& reader) {
        std::vector<ProviderKind> kinds;
        for (const std::string& text : requireTexts(reader, "kinds")) {
            const auto* found = std::find_if(kindNames.begin(), kindNames.end(),
                                             [&text](const auto& entry) { return text == entry.first; });
            if (found == kindNames.end()) {
                reader.refuseKey("kinds", "unknown kind '" + text + "', known are " + knownKinds());
            }
            kinds.push_back(found->second);
        }
        return kinds;
    }

    std::vector<std::string> readNameSpaces(TomlReader& reader) const {
        const auto known = _schema.nameSpaces();
        std::vector<std::string> nameSpaces;
        for (const std::string& text : requireTexts(reader, "namespaces")) {
            const auto found = std::find_if(known.begin(), known.end(),
                                            [&text](const std::string& name) { return equalNames(name, text); });
            if (found == known.end()) {
                reader.refuseKey("namespaces", "the schema has no namespace '" + text + "'");
            }
            nameSpaces.push_back(*found);
        }
        return nameSpaces;
    }

    std::vector<std::string> readClasses(TomlReader& reader, const std::vector<std::string>& nameSpaces) const {
        std::vector<std::string> classes;
        for (const std::string& text : requireTexts(reader, "classes")) {
            const auto without =
                std::find_if(nameSpaces.begin(), nameSpaces.end(), [&](const std::string& nameSpace) {
                    return _schema.findClass(nameSpace, text) == nullptr;
                });
            if (without != nameSpaces.end()) {
                reader.refuseKey("classes", "the schema has no class '" + text + "' in " + *without);
            }
            classes.push_back(_schema.findClass(nameSpaces.front(), text)->name);
        }
        return classes;
    }

    const std::string& _file;
    const std::string& _libraryDirectory;
    const Schema& _schema;
    const std::string _noPrefix;
    const std::string _providerPrefix = "provider.";
};

template <typename T>
const T* common(const std::vector<T>& left, const std::vector<T>& right) {
    const auto found = std::find_first_of(left.begin(), left.end(), right.begin(), right.end());
    return found == left.end() ? nullptr : &*found;
}

/** Throws when two registrations claim the same. */
void refuseConflict(const Registration& earlier, const Registration& later) {
    const auto* kind = common(later.kinds, earlier.kinds);
    const auto* nameSpace = common(later.nameSpaces, earlier.nameSpaces);
    const auto* className = common(later.classes, earlier.classes);
    if (kind != nullptr && nameSpace != nullptr && className != nullptr) {
        throw std::runtime_error(later.file + ":" + std::to_string(later.line) + ": provider.classes: " + *className +
                                 " in " + *nameSpace + " has its " + nameOf(*kind) + " provider already, " +
                                 earlier.name + " of " + earlier.file + ":" + std::to_string(earlier.line));
    }
}

std::vector<std::string> filesOf(const std::string& directory) {
    std::vector<std::string> files;
    std::error_code code;
    for (std::filesystem::directory_iterator entry(directory, code), end; !code && entry != end;
         entry.increment(code)) {
        if (entry->path().extension() == ".toml") {
            files.push_back(entry->path().string());
        }
    }
    if (code) {
        throw std::runtime_error(directory + ": cannot read the provider registrations: " + code.message());
    }
    std::sort(files.begin(), files.end());
    return files;
}

} // namespace

std::vector<Registration> readRegistrations(const std::vector<std::string>& directories,
                                            const std::string& libraryDirectory, const Schema& schema) {
    std::vector<Registration> registrations;
    for (const std::string& directory : directories) {
        for (const std::string& file : filesOf(directory)) {
            for (Registration& registration : FileReader(file, libraryDirectory, schema).read()) {
                for (const Registration& earlier : registrations) {
                    refuseConflict(earlier, registration);
                }
                registrations.push_back(std::move(registration));
            }
        }
    }
    return registrations;
}

} // namespace marlo
