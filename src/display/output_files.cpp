#include "display/output_files.h"

#include <algorithm>
#include <cstdio>
#include <cstring>
#include <filesystem>
#include <string>
#include <vector>

#include "core/dialogs.h"
#include "core/global.h"
#include "core/number_text.h"

namespace {

// The longest line: quote, 22 characters of number text, quote, CR LF.
constexpr size_t longest_line = 26;
// format_to may use 32 characters from where the number starts.
constexpr size_t format_scratch = 32;
// Lines formatted per write: a whole block of up to 65536 points goes out in one write, and a
// block of any size needs no more memory than this.
constexpr size_t chunk_lines = 65537;

// The bytes of lines first..first+count-1, line k holding sample k. A sample the array does not
// hold (an array shorter than the block) is written as 0 rather than read from beyond it.
size_t build_lines(const std::vector<double>& samples, size_t first, size_t count,
                   std::vector<char>& buffer) {
    const size_t needed = count * longest_line + format_scratch;
    if (buffer.size() < needed)
        buffer.resize(needed);
    char* const start = buffer.data();
    char* out = start;
    const size_t end = first + count;
    const size_t held_end = std::clamp(samples.size(), first, end);
    out += numtext::format_lines(out, samples.data() + first, held_end - first, "\"", "\"\r\n");
    for (size_t k = held_end; k < end; ++k) {
        std::memcpy(out, "\" 0\"\r\n", 6);
        out += 6;
    }
    return static_cast<size_t>(out - start);
}

// Writes one block of `lines` lines to the file, truncating it first or at its end. On any
// failure the file is closed and, if it is a regular file, cut back to the length it had
// before this block, so that a full disk in the middle of an append never leaves a file that
// seems to hold a block it holds only part of (a rewritten file is left empty).
bool write_block(const std::string& name, bool append, const std::vector<double>& samples, size_t lines,
                 std::vector<char>& buffer) {
    std::FILE* file = std::fopen(name.c_str(), append ? "ab" : "wb");
    if (file == nullptr)
        return false;
    std::setvbuf(file, nullptr, _IONBF, 0);  // direct writes from our buffer; errors show at once
    long before = 0;
    if (append && (std::fseek(file, 0, SEEK_END) != 0 || (before = std::ftell(file)) < 0))
        before = -1;
    bool ok = true;
    for (size_t first = 0; ok && first < lines; first += chunk_lines) {
        const size_t size = build_lines(samples, first, std::min(chunk_lines, lines - first), buffer);
        ok = std::fwrite(buffer.data(), 1, size, file) == size;
    }
    ok = std::fflush(file) == 0 && ok;
    ok = std::fclose(file) == 0 && ok;
    if (!ok && before >= 0) {
        std::error_code ec;
        if (std::filesystem::is_regular_file(name, ec))
            std::filesystem::resize_file(name, static_cast<std::uintmax_t>(before), ec);
    }
    return ok;
}

}  // namespace

void write_trace_files(int16_t& append) {
    // Kept from block to block so that a run does not allocate for every file.
    static std::vector<char> buffer;
    const bool appending = append == global::flag_true;
    // The block has num_points + 1 lines. The count is wide: a 16-bit counter would stop
    // blocks above 32767 points from being written at all.
    const size_t lines = global::num_points < 0 ? 0 : static_cast<size_t>(global::num_points) + 1;
    for (int t = 0; t <= 3; ++t) {
        const std::string& name = global::trace_file[t];
        if (global::trace_channel[t] <= 0 || name.empty())
            continue;
        if (!write_block(name, appending, global::trace_data(t), lines, buffer)) {
            dialogs::notice("Couldn't create " + name + ".  No output file was created");
            return;
        }
    }
}
