// The records through which engines read occupations, antennas, receivers and raw files:
// built here from the job's items, so that the exports only find the current task.
//
// Everything here reads item fields that do not change while engines run, and takes no lock;
// any engine thread may call it.
#pragma once

#include <cstdint>

#include "job/item_cursor.h"
#include "job/job_model.h"
#include "vox/vox_sdk_streams.h"

namespace vox {

using OccupationCursor = ItemCursor<TOccupItem>;
using LinkedOccupationCursor = ItemCursor<TROccupItem>;

// The record of one occupation. The request bits are taken from record.mask; the record is
// cleared and the mask then tells what was filled. False (with only the identifiers set)
// when the occupation has no raw file.
bool FillOccupationData(const JobModel& job, const TOccupItem& occupation,
                        vox_OccupationData& record);
bool FillOccupationDataEx(const JobModel& job, const TOccupItem& occupation,
                          vox_OccupationDataEx& record);

// Antenna records: cleared, then filled from the antenna (the plain form carries pattern
// slots 0 to 3, the extended form all sixteen with their mask and slot count).
void FillAntennaData(const TAntennItem& antenna, vox_AntennaData& record);
void FillAntennaDataEx(const TAntennItem& antenna, vox_AntennaDataEx& record);

// Receiver record: the identifier as given, then vendor, name and serial number.
void FillReceiverData(uint32_t id, const TReceiverItem& receiver, vox_ReceiverData& record);

// A linked occupation of a vector or fan.
void FillLinkedOccupation(const TOccupItem& occupation, vox_ROccupData& record);

// The occupations linked to a vector (selector not 0) or a fan (selector 0); null when the
// item is unknown or has none.
TROccupItem* LinkedOccupations(const JobModel& job, uint32_t item_id, uint32_t selector);

// A raw file's per-system signal mask, inverted so that a set bit marks an absent signal:
// one byte of codes and phases of L1C, L1P, L2C (plain), or code/phase pairs of all five
// signals (extended).
uint8_t AbsentSignalsPlain(uint32_t signal_mask);
uint32_t AbsentSignalsExtended(uint32_t signal_mask);

// Satellite state tables: every valid number usable, the job's omitted satellites excluded.
// The plain form holds GPS and GLONASS only.
void FillSatelliteStates(const JobModel& job, uint16_t (&states)[2][5]);
void FillSatelliteStatesEx(const JobModel& job, uint32_t (&states)[5][4]);

}  // namespace vox
