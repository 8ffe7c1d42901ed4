/// Registrations for port events that a library did not take back.
#pragma once

namespace cimple {

/// Asks the library once more to take back all registrations; those that remain are kept, and the libraries stay mapped
/// for them. While alerts are off or about to be enabled, under m_IndicationProviderMutex.
void retryRemovals();

} // namespace cimple
