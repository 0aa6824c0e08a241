// The output files: after each block, the samples of every shown trace that has a file name
// go to that file, one quoted standard number text per line, CR LF ended.
#pragma once

#include <cstdint>

// append is a flag: flag_false rewrites each file with this block, flag_true appends the block
// (creating the file when it is missing). Any failure shows "Couldn't create <name>.  No output
// file was created" once and leaves the remaining traces unwritten for this block.
void write_trace_files(int16_t& append);
