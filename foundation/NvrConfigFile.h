/// The provider's settings, "/etc/norvane_fc_provider.conf": read when the agent is built, written back when it goes.
///
/// Any thread may read, set and save the values while the file is not being loaded, without a lock. No fault in the
/// file is an error: what it does not say validly keeps its default.
#pragma once

#include <atomic>
#include <string>

#include "runtime/String.h"
#include "runtime/Type.h"

namespace cimple {

class NvrConfigFile {
public:
    NvrConfigFile() = default;
    /// Saves for good, unless that was done.
    ~NvrConfigFile();
    NvrConfigFile(const NvrConfigFile&) = delete;
    NvrConfigFile& operator=(const NvrConfigFile&) = delete;

    /// Stores the path and reads the file; not to be called while other threads use the object. For each key the first
    /// valid line wins. Of the look-up of the file only `errno` is tested: a stale ENOENT ends the load.
    void load(const char* path);
    /// Writes the file anew at the stored path, if it can be opened.
    void save();
    /// The same once: the object leaves the file alone afterwards. So it does at once where the file could not be read
    /// and no value was set since: the defaults in force are not what the administrator wrote there. Not to be called
    /// by two threads at once.
    void saveForGood();

    /// Minutes, 1 to 30.
    uint32 getCacheTimeout() const;
    bool getRefreshAdapterData() const;
    bool getRefreshSANData() const;

    /// Results: 0, or -1 for a value out of range (1 to 30; 0 or 1), which changes nothing.
    int setCacheTimeout(uint32 minutes);
    int setRefreshAdapterData(uint32 flag);
    int setRefreshSANData(uint32 flag);

private:
    std::atomic<bool> m_refreshAdapterData{false};
    std::atomic<bool> m_refreshSANData{true};
    std::atomic<uint32> m_cacheTimeout{10};
    String m_path;
    bool m_saved_for_good = false;
    std::atomic<bool> m_unread{false}; ///< the file holds what nobody knows
};

/// The agent's settings file.
extern const char* const provider_config_path;

/// The URL of the management web launcher: the first line of "/etc/nvr_smis.conf" that is neither blank nor a comment,
/// without its leading white space. Empty if there is none.
std::string readWebLaunchURL();

} // namespace cimple
