/**
 * @file
 * A directory with a schema and registrations, and an object manager over them.
 */
#pragma once

#include "host/cimom/ObjectManager.h"

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <memory>
#include <mutex>
#include <stdexcept>
#include <string>
#include <vector>

namespace marlo::test {

/** Removed with everything in it at the end. */
class ProviderSite {
  public:
    ProviderSite() {
        std::string pattern = (std::filesystem::temp_directory_path() / "marlo-site-XXXXXX").string();
        if (mkdtemp(pattern.data()) == nullptr) {
            throw std::runtime_error("cannot make a directory like " + pattern);
        }
        _directory = pattern;
        std::filesystem::create_directory(_directory / "schema");
        std::filesystem::create_directory(_directory / "providers");
        write("schema/test.mof", schemaText);
    }

    ~ProviderSite() {
        std::error_code ignored;
        std::filesystem::remove_all(_directory, ignored);
    }

    ProviderSite(const ProviderSite&) = delete;
    ProviderSite& operator=(const ProviderSite&) = delete;

    void write(const std::string& file, const std::string& text) const { std::ofstream(_directory / file) << text; }

    /** A registration file of one provider in "root/test". */
    void provide(const std::string& library, const std::string& provider, const std::string& className,
                 const std::vector<std::string>& kinds = {"instance"}) const {
        std::string list;
        for (const std::string& kind : kinds) {
            list += (list.empty() ? "\"" : ", \"") + kind + "\"";
        }
        write("providers/" + provider + ".toml", "library = \"" + library + "\"\n[[provider]]\nname = \"" + provider +
                                                     "\"\nkinds = [" + list + "]\nnamespaces = [\"root/test\"]\n" +
                                                     "classes = [\"" + className + "\"]\n");
    }

    [[nodiscard]] std::filesystem::path directory() const { return _directory; }

    /** What the object manager logs goes to lines(). */
    [[nodiscard]] std::unique_ptr<ObjectManager> start(const std::string& libraryDirectory) {
        ObjectManagerOptions options;
        options.schemaDirectories = {(_directory / "schema").string()};
        options.providerDirectories = {(_directory / "providers").string()};
        options.libraryDirectory = libraryDirectory;
        options.log = [this](const std::string& line) {
            const std::lock_guard lock(_mutex);
            _lines.push_back(line);
        };
        return std::make_unique<ObjectManager>(options);
    }

    [[nodiscard]] std::vector<std::string> lines() const {
        const std::lock_guard lock(_mutex);
        return _lines;
    }

    static constexpr const char* schemaText = R"(
Qualifier Key : boolean = false, Scope(property, reference), Flavor(DisableOverride);
Qualifier Description : string = null, Scope(any), Flavor(Translatable);
#pragma namespace ("root/other")
class Test_Elsewhere { [Key] string Id; };
#pragma namespace ("root/test")
class Test_Base { string Note; };
class Test_Thing : Test_Base {
    [Key, Description("first")] string Id;
    [Key] uint16 Number;
    string List[];
    datetime When;
};
class Test_SubThing : Test_Thing { string Extra; };
class Test_Odd : Test_Base { [Key] string Id; uint16 Count; uint16 Counts[]; };
class Test_Keys {
    [Key] datetime When;
    [Key] sint8 Small;
    [Key] boolean Flag;
};
class Test_Unserved { [Key] string Id; };
)";

  private:
    std::filesystem::path _directory;
    mutable std::mutex _mutex;
    std::vector<std::string> _lines;
};

} // namespace marlo::test
