#include "inventory/PortStatistics.h"

#include <exception>

#include "foundation/AttributeBlock.h"
#include "foundation/CLogger.h"
#include "foundation/NVR_Common.h"

namespace cimple {

namespace {

struct Counter {
    uint16 number;
    uint64 FCPortStatistics::*field;
};

using S = FCPortStatistics;

constexpr Counter counters[] = {
    {RM_STAT_SECONDS_SINCE_RESET, &S::SecondsSinceLastReset},
    {RM_STAT_TX_FRAMES, &S::PacketsTransmitted},
    {RM_STAT_RX_FRAMES, &S::PacketsReceived},
    {RM_STAT_TX_WORDS, &S::WordsTransmitted},
    {RM_STAT_RX_WORDS, &S::WordsReceived},
    {RM_STAT_LIP_COUNT, &S::LIPCount},
    {RM_STAT_NOS_COUNT, &S::NOSCount},
    {RM_STAT_ERROR_FRAMES, &S::ErrorFrames},
    {RM_STAT_DUMPED_FRAMES, &S::DumpedFrames},
    {RM_STAT_LINK_FAILURES, &S::LinkFailures},
    {RM_STAT_LOSS_OF_SYNC, &S::LossOfSyncCounter},
    {RM_STAT_LOSS_OF_SIGNAL, &S::LossOfSignalCounter},
    {RM_STAT_PRIMITIVE_SEQUENCE_ERRORS, &S::PrimitiveSeqProtocolErrCount},
    {RM_STAT_INVALID_TX_WORDS, &S::InvalidTransmissionWords},
    {RM_STAT_CRC_ERRORS, &S::CRCErrors},
    {RM_STAT_EXCHANGES_ORIGINATED, &S::ExCountOrig},
    {RM_STAT_EXCHANGES_RESPONDED, &S::ExCountResp},
    {RM_STAT_TX_SEQUENCES, &S::TxSequences},
    {RM_STAT_RX_SEQUENCES, &S::RxSequences},
    {RM_STAT_LINK_TRANSITIONS, &S::LinkTransitions},
    {RM_STAT_ACTIVE_RPIS, &S::ActiveRPIs},
    {RM_STAT_ACTIVE_XRIS, &S::ActiveXRIs},
    {RM_STAT_PRIMITIVE_SEQUENCE_TIMEOUTS, &S::PrimitiveSeqTimesouts},
    {RM_STAT_ELASTIC_BUFFER_OVERRUNS, &S::ElasticBufOverruns},
    {RM_STAT_ARBITRATION_TIMEOUTS, &S::ArbitrationTimeouts},
};

constexpr uint64 all_ones = ~uint64{0}; // a counter that the hardware does not have

} // namespace

FCPortStatistics::FCPortStatistics(const std::string& portName)
{
    AttributeBlock block(RM_STATISTICS_BLOCK_SIZE);
    if (!block.valid()) {
        NVR_LOG("ERROR: nvrcimGetPortStatistics: Unable to allocate buffer");
        throw std::exception();
    }
    HBA_WWN wwn;
    if (!string2HBAName(&wwn, portName.c_str())) {
        NVR_LOG("NVR_MethodWrapper::string2HBAName failed");
        throw std::exception();
    }
    if (const uint32 status = block.fill(RM_GetPortStatistics, wwn)) {
        NVR_LOG("ERROR: RM_GetPortStatistics call failed (%d)", static_cast<int>(status));
        throw std::exception();
    }
    for (const Counter& counter : counters) {
        uint64 value = all_ones;
        if (block.wide(counter.number, value) && value != all_ones) this->*counter.field = value;
    }
}

} // namespace cimple
