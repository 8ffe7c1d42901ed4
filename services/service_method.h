/// What the methods of the services have in common besides their return values (agent/method_answer.h): the checks that
/// they open with.
///
/// A service's method logs its entry, takes the agent wait (agent/Agent_Wait.h) and holds it to its end, and then asks
/// the functions below, in this order: is it invoked on the service, is its Target a port that the agent knows, what is
/// that port's name for the library. All of them need the agent wait; the words of a refusal that differ from service
/// to service are the caller's.
///
/// Instances come from a client: they are read by name and type, whatever class they claim.
#pragma once

#include "agent/Instance_Map.h"
#include "agent/method_answer.h"
#include "foundation/management_api.h"

namespace cimple {

class ProviderAgent;

/// True if a method that is invoked on `self` is meant for the service in `services`: `self` is of the service's class,
/// and has the keys of the first one, or of any, unless there is none yet.
bool isFirstService(const Instance_Map& services, const Instance* self);
bool isAnyService(const Instance_Map& services, const Instance* self);

/// The DeviceID of a port, or null: for a null or classless one, for a class without such a text, for one without a
/// value. The text is the instance's.
const char* deviceID(const Instance* port);

/// True if `target` is a port by its class and the agent knows its DeviceID. The look-up logs its own words.
bool isKnownFCPort(ProviderAgent& agent, const Instance* target);

/// The library's name of the port with that DeviceID. False for a text that is none, after "`who`::Id2HBAName failed"
/// or "`who`::str2HBAName failed".
bool portName(HBA_WWN& name, const char* deviceID, const char* who);

} // namespace cimple
