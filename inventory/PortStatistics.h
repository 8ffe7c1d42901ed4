/// A port's counters at one moment.
#pragma once

#include <string>

#include "runtime/Type.h"

namespace cimple {

class PortStatistics {
public:
    PortStatistics() = default;
    virtual ~PortStatistics() noexcept(false) {}
    PortStatistics(const PortStatistics&) = delete;
    PortStatistics& operator=(const PortStatistics&) = delete;
};

/// Each counter is 0xFFFFFFFF unless the hardware reported it. Names are those of the published properties.
class FCPortStatistics : public PortStatistics {
public:
    static constexpr uint64 not_reported = 0xFFFFFFFF;

    /// Reads the counters of the port with this WWPN (16 digits). Throws std::exception, logged, if that fails.
    explicit FCPortStatistics(const std::string& portName);

    uint64 SecondsSinceLastReset = not_reported; ///< not published
    uint64 PacketsTransmitted = not_reported;
    uint64 WordsTransmitted = not_reported; ///< published as BytesTransmitted, 4 times the value
    uint64 PacketsReceived = not_reported;
    uint64 WordsReceived = not_reported; ///< published as BytesReceived, 4 times the value
    uint64 LIPCount = not_reported;
    uint64 NOSCount = not_reported;
    uint64 ErrorFrames = not_reported;
    uint64 DumpedFrames = not_reported;
    uint64 LinkFailures = not_reported;
    uint64 LossOfSyncCounter = not_reported;
    uint64 LossOfSignalCounter = not_reported;
    uint64 PrimitiveSeqProtocolErrCount = not_reported;
    uint64 InvalidTransmissionWords = not_reported;
    uint64 CRCErrors = not_reported;
    uint64 TxSequences = not_reported;
    uint64 RxSequences = not_reported;
    uint64 ExCountOrig = not_reported;
    uint64 ExCountResp = not_reported;
    uint64 ActiveXRIs = not_reported;
    uint64 ActiveRPIs = not_reported;
    uint64 ElasticBufOverruns = not_reported;
    uint64 LinkTransitions = not_reported;
    uint64 PrimitiveSeqTimesouts = not_reported;
    uint64 ArbitrationTimeouts = not_reported;
};

} // namespace cimple
