/**
 * @file
 * One change of one adapter, from what is in force to what is wanted.
 */
#pragma once

#include "agent/persistence/FileTransaction.h"
#include "agent/write/HostWriter.h"
#include "agent/write/Undo.h"

#include <mutex>

namespace Orv::Agent::Linux {

/**
 * Makes the change step by step. One object is one change on one thread; the parts must outlive it.
 *
 * The order: what can refuse comes first. The DHCP client ends before the files change, so that it does not write
 * over what follows; the kernel comes after the files, since it is the step that most often fails on its own account
 * and the one that is quickest to take back; running services read the files when these are complete; and the DHCP
 * client starts last, because that may take a minute.
 */
class AdapterChange {
  public:
    AdapterChange(const WriterParts& parts, std::mutex& filesMutex, const AdapterFacts& adapter,
                  const AdapterSettings& inForce, const AdapterSettings& wanted);

    /** Throws std::exception after having put everything back; the text says so where that failed. */
    void make();

  private:
    void makeSteps();
    void stopClient();
    void editFiles();
    void putFilesBack();
    void changeKernel();
    void tellNameService();
    void startClient();
    [[nodiscard]] Persistence::FileEdits plan(const AdapterSettings& settings) const;

    [[nodiscard]] bool mayHaveClient() const;
    [[nodiscard]] bool concernsKernel() const;

    [[nodiscard]] bool goesTo(AddressMode mode) const { return _wanted.ipv4 && _wanted.ipv4->mode == mode; }

    const WriterParts& _parts;
    std::mutex& _filesMutex;
    const InterfaceFacts& _interface;
    const bool _isConfiguredFixed;
    const AdapterSettings& _inForce;
    const AdapterSettings& _wanted;
    const std::unique_ptr<Persistence::Manager> _manager;
    const std::unique_ptr<Persistence::NameService> _nameService; ///< null when names stay as they are
    Persistence::FileTransaction _files;
    std::optional<InterfaceTables> _expected; ///< what the kernel should have; none when it is not touched
    Undo _undo;
};

} // namespace Orv::Agent::Linux
