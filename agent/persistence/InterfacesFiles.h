/**
 * @file
 * All files of interfaces(5) that a host has, in the order in which ifupdown reads them.
 */
#pragma once

#include "agent/persistence/InterfacesFile.h"

#include <deque>
#include <set>
#include <string>
#include <vector>

namespace Orv::Agent::Persistence {

/** Reads them when it is made. */
class InterfacesFiles {
  public:
    struct File {
        std::string path; ///< root included
        InterfacesFile content;
    };

    /** One stanza with the file it is in. */
    struct Place {
        const File* file;
        const InterfacesFile::Stanza* stanza;

        /** The words of its header. */
        [[nodiscard]] std::vector<InterfacesFile::Word> words() const {
            return file->content.wordsOf(file->content.header(*stanza));
        }

        [[nodiscard]] const std::string& keyword() const { return file->content.header(*stanza).keyword; }
    };

    /**
     * `root` as in Environment. Throws std::runtime_error when a file that counts cannot be read, or when files
     * source one another without end.
     */
    explicit InterfacesFiles(std::string root);

    InterfacesFiles(const InterfacesFiles&) = delete;
    InterfacesFiles& operator=(const InterfacesFiles&) = delete;

    /** The stanzas of all files, in the order of reading. */
    [[nodiscard]] const std::vector<Place>& stanzas() const { return _stanzas; }

    /** /etc/network/interfaces; null when there is none. */
    [[nodiscard]] const File* mainFile() const { return _files.empty() ? nullptr : &_files.front(); }

    /** Where the main file is or would be. */
    static std::string mainPath(const std::string& root);

  private:
    void readFile(const std::string& path, int depth);
    void readDirectory(const std::string& path, int depth);
    void follow(const File& file, const InterfacesFile::Statement& source, int depth);

    std::string _root;
    std::deque<File> _files; ///< stays where it is when it grows
    std::vector<Place> _stanzas;
    std::set<std::string> _read;
};

} // namespace Orv::Agent::Persistence
