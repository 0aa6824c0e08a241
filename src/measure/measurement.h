// Measurement set-up and arming, the trigger-consistency warnings, and the block read.
#pragma once

// Shows, in one box, every contradiction between the trigger source and the channels set to
// trigger. Only warns.
void check_trigger_setup();

// Sends the measurement settings to the module, reads back block size and span, initialises
// the measurement and, across mainframes, arms it. The caller then starts waiting for data.
void setup_measurement();

// Reads the block of every enabled input channel (into the first trace showing it, or a scratch
// array), the range of each shown channel, copies shared channels, and sets x_values.
void read_block();
