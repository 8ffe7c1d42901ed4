#include "services/Curl_Library.h"

#include <dlfcn.h>
#include <utility>

#include "foundation/CLogger.h"
#include "foundation/curl_places.h"
#include "foundation/library_closing.h"
#include "runtime/guarded.h"

namespace cimple {

template <class Signature>
void Curl_Entry<Signature>::logError() const
{
    if (!error.empty()) NVR_LOG("A dynamic linking error occurred:(%s)", error.c_str());
}
template struct Curl_Entry<void*()>;
template struct Curl_Entry<int(void*, int, ...)>;
template struct Curl_Entry<int(void*)>;
template struct Curl_Entry<void(void*)>;
template struct Curl_Entry<void()>;

Curl_Library::~Curl_Library() noexcept(false)
{
    if (!m_library) return;
    if (handle && easy_cleanup) guarded([&] { easy_cleanup.call(handle); });
    if (initialised && global_cleanup) guarded([&] { global_cleanup.call(); });
    closeLibrary(m_library);
}

template <class Signature>
void Curl_Library::bind(Curl_Entry<Signature>& entry)
{
    ::dlerror(); // forgets what went wrong before
    entry.call = reinterpret_cast<Signature*>(::dlsym(m_library, entry.name));
    if (const char* error = ::dlerror()) entry.error = error;
}

bool Curl_Library::open()
{
    m_library = openCurl();
    if (!m_library) return false;
    bind(version);
    bind(global_init);
    bind(easy_init);
    bind(easy_setopt);
    bind(easy_perform);
    bind(easy_cleanup);
    bind(global_cleanup);
    return true;
}

void Curl_Library::logVersion() const
{
    if (!version) return;
    NVR_LOG("Found curl_version function");
    const char* const text = version.call();
    NVR_LOG("Curl version = %s", text ? text : "");
}

bool Curl_Library::close()
{
    return closeLibrary(std::exchange(m_library, nullptr)) == 0;
}

} // namespace cimple
