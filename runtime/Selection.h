/// What the caller of an enumeration will look at, so that a provider need not copy all the rest.
///
/// The caller makes one on its stack for the data word of its handler. A provider that is asked on the same thread may
/// find it by that handler, and then hands out, in its order, what is wanted and no more. One that does not look hands
/// out everything, so the caller goes on testing what it gets.
#pragma once

#include "runtime/Registration.h"

namespace cimple {

class Selection {
public:
    /// The values of an instance that will be looked at: all; all, but of the ends of references the keys alone; keys.
    enum class Values { all, keys_of_ends, keys };

    /// What the handler does with an instance that it was handed: it may change it, or it never does, so that it may
    /// get a count of one that others read too.
    enum class Handler { may_write, only_reads };

    Selection(const void* handler_data, Values values, Handler handler = Handler::may_write);
    virtual ~Selection();
    Selection(const Selection&) = delete;
    Selection& operator=(const Selection&) = delete;

    /// The selection of this thread's caller with that handler, or null.
    static Selection* of(const Enum_Handler& handler);

    Values values() const { return m_values; }
    bool only_reads() const { return m_handler == Handler::only_reads; }

    /// If not null: only the first instance that key_eq finds equal to this one is wanted.
    virtual const Instance* key() const { return nullptr; }
    /// Whether this instance is wanted. Asked for each in order, unless there is a key, and under the provider's locks:
    /// quick, and without an effect outside of the selection.
    virtual bool wants(const Instance*) { return true; }
    /// Told when all were asked about, before the first is handed out.
    virtual void asked_all() {}

private:
    const void* m_handler_data;
    Values m_values;
    Handler m_handler;
    Selection* m_outer;
};

} // namespace cimple
