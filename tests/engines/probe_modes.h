// The probe engine's optional modes, each switched on by a parameter of the job's [JOB]
// section and each writing what it did and read to the probe's report:
//   ProbeResults=1|2  stores known results through every result function (probe_results.cpp)
//   ProbeEphemeris=<satellites>  reads the broadcast and precise ephemerides of the listed
//                     satellites, e.g. "G5,R7,E11,C3,S20" (probe_ephemeris.cpp)
//   ProbeEpochs=1     walks every epoch and satellite of every occupation (probe_epochs.cpp)
// The modes run on the engine's group call, after the stream walks of the default probe.
#pragma once

#include "probe_output.h"
#include "vox/vox_engine.h"

namespace probe {

// Writes the known values of probe_values.h; a thread of its own writes some of them through
// its own writer. Mode 2 ends with a ray whose position is not a number.
void StoreResults(Output& out, const vox_ThreadContext* context, int mode);
// Satellites are a comma-separated list of a system letter (G, R, E, C, S) and a number.
void ReadEphemerides(Output& out, const char* satellites);
void ReadEpochs(Output& out);

}  // namespace probe
