/// The nine tests of the Common Diagnostic Model, as one table: what is published of each, and what carries it out.
///
/// Constant data.
#pragma once

#include <array>
#include <cstddef>

#include "runtime/Type.h"

namespace cimple {

struct Diagnostic_Run;
class String;

enum class Test_Id : uint32 {
    beacon = 1,
    echo = 2,
    externalLoopback = 3,
    hostLoopback = 4,
    internalLoopback = 5,
    ping = 6,
    reset = 7,
    self = 8,
    status = 9
};

/// Up to `capacity` values; none leaves the property null. The values end at the first zero.
template <class T, std::size_t capacity>
struct Few {
    T values[capacity] = {};

    constexpr std::size_t size() const
    {
        std::size_t size = 0;
        while (size < capacity && values[size])
            size++;
        return size;
    }
};

struct Diagnostic_Test {
    Test_Id id;
    const char* name; // the key of nearly all instances of the test; runs select by it
    const char* description;
    uint16 type; // FCHBATestType
    Few<uint16, 2> testTypes;
    Few<uint16, 2> characteristics;
    Few<uint16, 1> loopControl;
    Few<const char*, 1> loopControlParameter;
    Few<uint16, 2> supportedLoopControl;
    Few<uint16, 1> supportedExecutionControls;
    Few<const char*, 5> otherExecutionControls;
    uint8 haltOnError;                  // 0 false, 1 true, 2: the property is null
    uint32 (*run)(Diagnostic_Run& run); // result as RunDiagnosticService's, before 40000 is added

    /// Runs inside the adapter, which counts its loops.
    bool isPolled() const { return takesPattern() || id == Test_Id::self; }
    /// Sends a pattern of the client's.
    bool takesPattern() const { return id >= Test_Id::echo && id <= Test_Id::ping; }
    /// Goes to a device on the SAN.
    bool takesTarget() const { return id == Test_Id::echo || id == Test_Id::ping; }
    /// Has settings that a client can override.
    bool takesOverrides() const { return id <= Test_Id::ping; }
};

/// In the order in which the instances are made.
extern const std::array<Diagnostic_Test, 9> diagnostic_tests;

/// The test of that very name, every character compared; null if there is none.
const Diagnostic_Test* find_diagnostic_test(const String& name);

} // namespace cimple
