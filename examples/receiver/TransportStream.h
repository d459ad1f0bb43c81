// The basics of packets, and the PIDs and table_ids that the receiver knows.
#ifndef RECEIVER_TRANSPORTSTREAM_H
#define RECEIVER_TRANSPORTSTREAM_H

#include <cstddef>
#include <cstdint>

namespace receiver {

constexpr size_t kPacketSize = 188;
constexpr unsigned char kSyncByte = 0x47;
constexpr size_t kPidCount = 8192;

// Returns the PID of a packet.
inline uint16_t PidOf(const unsigned char *packet) {
    return static_cast<uint16_t>((packet[1] & 0x1F) << 8 | packet[2]);
}

constexpr uint16_t kPidPat = 0x0000;
constexpr uint16_t kPidNit = 0x0010;
constexpr uint16_t kPidSdt = 0x0011;
constexpr uint16_t kPidEit = 0x0012;
constexpr uint16_t kPidTime = 0x0014;
constexpr uint16_t kPidEitMobile = 0x0026;  // events of portable reception
constexpr uint16_t kPidEitOneSeg = 0x0027;  // events of one-seg reception
constexpr uint16_t kPidOneSegPmt = 0x1FC8;  // PMTs of one-seg services, to 0x1FCF
constexpr uint16_t kPidNull = 0x1FFF;

// Sections are assembled on all of these PIDs. Those of CAT, SDTT, BIT, NBIT, one-seg SDTT and CDT
// are only counted.
constexpr uint16_t kTablePids[] = {kPidPat,       0x0001, kPidNit, kPidSdt, kPidEit,
                                   kPidTime,      0x0023, 0x0024,  0x0025,  kPidEitMobile,
                                   kPidEitOneSeg, 0x0028, 0x0029};

constexpr uint8_t kTablePat = 0x00;
constexpr uint8_t kTablePmt = 0x02;
constexpr uint8_t kTableNitActual = 0x40;
constexpr uint8_t kTableSdtActual = 0x42;
constexpr uint8_t kTableEitActual = 0x4E;          // present and following
constexpr uint8_t kTableEitOther = 0x4F;           // of another transport stream
constexpr uint8_t kTableEitActualSchedule = 0x50;  // to 0x5F
constexpr uint8_t kTableEitOtherSchedule = 0x60;   // to 0x6F
constexpr uint8_t kTableEitLast = 0x6F;
constexpr uint8_t kTableTdt = 0x70;
constexpr uint8_t kTableTot = 0x73;

constexpr uint8_t kStreamPrivateSections = 0x05;  // stream_type
constexpr uint8_t kStreamPrivateData = 0x06;
constexpr uint8_t kDescriptorApplicationSignalling = 0x6F;
constexpr uint8_t kDescriptorDataComponent = 0xFD;
constexpr uint16_t kDataCaptions = 0x0008;
constexpr uint16_t kDataCaptionsOneSeg = 0x0012;
constexpr uint16_t kDataAit = 0x00A3;

}  // namespace receiver

#endif
