/**
 * @file
 * Making planned changes of files, and taking them back.
 */
#pragma once

#include "agent/persistence/FileEdit.h"

#include <string>
#include <vector>

#include <sys/types.h>

namespace Orv::Agent::Persistence {

/**
 * Applies edits one after the other. At every moment, a kill and a loss of power included, each file is either whole
 * as before or whole as wanted: the new content goes to a temporary file beside it, onto the disk, and over the old
 * name by rename(2); then the directory goes onto the disk. A symbolic link is followed: its target is replaced and
 * the link stays. Owner, mode and access control lists of a replaced file are those of the old one. Directories that
 * a new file needs are made, mode 0755.
 *
 * What was applied is taken back by revert(), and by the destructor unless commit() was called. For one thread at a
 * time; who writes the same files at the same time is found out by comparing them with the plan.
 */
class FileTransaction {
  public:
    FileTransaction() = default;
    ~FileTransaction();
    FileTransaction(const FileTransaction&) = delete;
    FileTransaction& operator=(const FileTransaction&) = delete;

    /**
     * Applies the edits, beside those applied before. When one fails, those of this call are taken back and
     * std::runtime_error (std::system_error where the system refused) is thrown with the file and the reason: also
     * when a file is no longer what its edit was planned for. An edit that changes nothing touches nothing.
     */
    void apply(const FileEdits& edits);

    /**
     * Puts back what was there before the first apply(), last edit first. A file that somebody else has changed since
     * is left alone. Every file is tried; then std::runtime_error is thrown that names those which could not be put
     * back.
     */
    void revert();

    /** What was applied stays. */
    void commit() noexcept {
        _applied.clear();
        _directories.clear();
    }

  private:
    void takeBack(std::size_t files, std::size_t directories, std::string& failures);

    FileEdits _applied;
    std::vector<std::string> _directories; ///< made for new files, outermost first
};

} // namespace Orv::Agent::Persistence
