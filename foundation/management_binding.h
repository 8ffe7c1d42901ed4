/// The binding of the adapter maker's libraries: each management operation as a function object of its own name, which
/// looks its symbol up at run time and answers a plain status when library or symbol is missing.
///
/// `loadLibraries` and `unloadLibraries` are for the agent's constructor and destructor; the operations may be called
/// from any thread in between. The libraries are not taken for re-entrant: callers serialise. Nothing here logs.
///
/// Results: 0 success, 7 more data, 8 stale data, 9 SCSI check condition, others as the library has them; 1 also for a
/// missing library or symbol (0 for the counts and RM_GetNextVpdEntry, null for RM_GetAttributeValue).
#pragma once

#include <atomic>

#include "foundation/management_api.h"
#include "runtime/Type.h"

namespace cimple {

enum LibrarySlot : unsigned { SLOT_HBAAPI, SLOT_LRMAPI, SLOT_RMAPI, SLOT_TSSDM, number_of_slots };

/// Opens lib`name`.so from the loader's search path into the slot. Result 1, also if it is open already; 0 on failure.
int loadLibrary(LibrarySlot slot, const char* name);

/// Opens what there is: HBAAPI, tssdm, and lrmapi or else rmapi. Result 0, or 1 if tssdm is missing or rmapi had to
/// stand in. With neither management library the result says nothing of it.
int loadLibraries();

/// Closes all slots, in order, and forgets every symbol and every missing library, so that a new load binds afresh. No
/// operation may be running. While the process exits, the libraries are forgotten alone. Result 0.
int unloadLibraries();

/// While `keep` is in force, unloadLibraries forgets the libraries but leaves them in the process, for one of them that
/// may still call back. False at the start.
void keepLibrariesMapped(bool keep);

/// Which libraries a name is looked up in, and under which names.
enum class Family {
    management,       ///< LRM_x in lrmapi; in its stead LRM_x, then RM_x in rmapi
    plain_management, ///< RM_x in lrmapi; in its stead RM_x in rmapi
    hba,              ///< HBA_x in HBAAPI; in its stead HBA_x in rmapi
    cpqfc,            ///< CPQFC_x in tssdm; in its stead CPQFC_x in rmapi
    cpqfc_close       ///< CPQFC_CloseAdapter alone: always in rmapi, or the process's global scope if that is closed
};

/// One operation's name and the symbol that was found for it. Constant-initialised; never destroyed.
class ForwardName {
public:
    constexpr ForwardName(Family family, const char* name) : m_family(family), m_name(name) {}
    ForwardName(const ForwardName&) = delete;
    ForwardName& operator=(const ForwardName&) = delete;

    const char* name() const { return m_name; }

protected:
    /// The symbol to call, or null.
    void* resolve();

private:
    friend int unloadLibraries();
    const Family m_family;
    const char* const m_name;
    std::atomic<void*> m_symbol{nullptr};
};

/// An operation of a library. Called like the function it stands for; arguments and result pass unchanged.
template <class Signature>
class Forward;

template <class Result, class... Arguments>
class Forward<Result(Arguments...)> : public ForwardName {
public:
    /// `missing` gives the result when nothing is found.
    constexpr Forward(Family family, const char* name, Result (*missing)())
        : ForwardName(family, name), m_missing(missing)
    {
    }

    Result operator()(Arguments... arguments)
    {
        if (void* symbol = resolve()) return reinterpret_cast<Result (*)(Arguments...)>(symbol)(arguments...);
        return m_missing();
    }

private:
    Result (*const m_missing)();
};

#define NVR_DECLARE_FORWARD(result, name, missing, parameters, arguments) extern Forward<name##_t> name;
NVR_MANAGEMENT_OPERATIONS(NVR_DECLARE_FORWARD)
NVR_PLAIN_MANAGEMENT_OPERATIONS(NVR_DECLARE_FORWARD)
NVR_HBA_OPERATIONS(NVR_DECLARE_FORWARD)
NVR_CPQFC_OPERATIONS(NVR_DECLARE_FORWARD)
#undef NVR_DECLARE_FORWARD

/// The library's words for a status; empty if it has none.
struct StatusText {
    explicit StatusText(uint32 status);
    const char* c_str() const { return m_text; }

private:
    char m_text[RM_STATUS_TEXT_SIZE + 1] = {};
};

} // namespace cimple
