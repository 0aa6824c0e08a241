// The simulated measurement: sample clock, triggering, block bookkeeping and the data of a block.
//
// A measurement runs at 2.56 x span samples per second from sample 0 at its start (the call to
// ost7720_initMeasure, or the last multi-mainframe arming step). Block size, span, data mode and
// automatic triggering are latched at the start from the first input of the measured channels.
// A block starts at a trigger and is complete block size / sample rate later:
//   - block data (340): one block per trigger; after a block is complete the module waits until
//     it is read, then re-arms and looks for the next trigger from that moment on;
//   - continuous data (341): after the first trigger, blocks follow one another without a gap.
// Triggers: automatic (fires as soon as the module is armed), ost7720_triggerMeasure (fires at
// the sample of the call, or at re-arming when it came while the module was not armed), an input
// whose trigger is on (its signal crossing its levels, which are percent of its range, with
// hysteresis), and a source whose trigger is on (the start of each period of its output). With
// none of them there is never a block. Every input reads its own sequence of blocks; the module
// memory keeps the newest 2 x (largest block size) / block size blocks, and an input that falls
// further behind skips to the oldest kept block (blockAvailable then warns with status 1).
//
// Input signal: the sum of the active sources of the session's modules (loopback), with AC
// coupling taking off their DC part, plus 1 mV rms of noise seeded per channel, clipped at the
// input range. Data are generated when read, from the settings of that moment (the sources' sum
// of a block is worked out once and shared by the inputs that read it while those settings hold).
// The ramp rate ramps a source's amplitude up from 0 over that many seconds after it was made
// active.
#pragma once

#include <cstdint>
#include <span>
#include <vector>

#include "system.h"

namespace sim {

void start_measurement(Session& s, const std::vector<int32_t>& ids, double now);
void start_running(Measurement& m, double now);

// Brings triggers and completed blocks up to the clock.
void advance(Session& s, double now);

// The fewest unread blocks among these inputs (those that take part in the measurement; 0 when
// none does). overrun is set when one of them had lost blocks.
int64_t available_blocks(Session& s, const std::vector<int32_t>& ids, bool& overrun);

// The signal of input `id` at samples first .. first + out.size() - 1 of the measurement.
void render_input(const Session& s, int32_t id, int64_t first, std::span<double> out, bool block_aligned);

// The next unread block of an input: its time samples. Moves the input on to the following block
// and re-arms a block-mode measurement when this was the newest block. False when none is there.
bool take_block(Session& s, int32_t id, double now, std::vector<double>& samples);

}  // namespace sim
