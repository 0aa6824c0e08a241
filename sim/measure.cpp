#include "measure.h"

#include <algorithm>
#include <array>
#include <bit>
#include <cmath>
#include <cstddef>
#include <limits>

#include "signals.h"

namespace sim {

namespace {

constexpr double index_tolerance = 1e-6;  // so t = k / rate never lands just below sample k
constexpr int64_t scan_chunk = 4096;
constexpr double scan_limit_seconds = 10.0;  // input triggers look back at most this far

int64_t samples_taken(const Measurement& m, double now) {
    return static_cast<int64_t>(std::floor((now - m.t0) * m.sample_rate + index_tolerance));
}

int64_t first_sample_at_or_after(const Measurement& m, double t) {
    return static_cast<int64_t>(std::ceil((t - m.t0) * m.sample_rate - index_tolerance));
}

signals::SourceParams source_params(const Channel& src, double sample_rate) {
    signals::SourceParams p;
    p.mode = src.source.mode;
    p.output = src.source.output;
    p.range = src.range;
    p.frequency = src.source.sine_freq;
    p.phase_deg = src.source.sine_phase;
    p.duty_cycle = src.source.duty_cycle;
    p.seed = src.source.seed;
    p.ramp_seconds = src.source.ramp_rate;
    p.sample_rate = sample_rate;
    p.block_size = src.source.blocksize;
    p.amp_scale = src.source.amp_scale;
    p.arb_table = src.source.arb_table;
    p.active_since = src.active_since;
    return p;
}

uint32_t noise_seed(const Channel& ch, const System& sys, int32_t index) {
    return static_cast<uint32_t>(sys.modules[static_cast<size_t>(ch.module)].config.address) * 256u +
           static_cast<uint32_t>(index) + 1u;
}

// Index of a channel among its module's inputs (for the noise seed).
int32_t input_index(const Channel& ch) {
    const auto& inputs = state().modules[static_cast<size_t>(ch.module)].inputs;
    return static_cast<int32_t>(&ch - inputs.data());
}

const Channel* channel_of(const Session& s, int32_t id) {
    const ChannelRef* ref = find_channel(s, id);
    return ref ? &channel_at(*ref) : nullptr;
}

// Equal to the bit, so that -0 and 0 count as different and a NaN as equal to itself.
bool same_bits(double a, double b) {
    return std::bit_cast<uint64_t>(a) == std::bit_cast<uint64_t>(b);
}

// The sum of the session's active sources as an input sees them (AC coupled or not) over n samples
// from t_first. Every input of a block sees the same sum, so the last few sums are kept with
// everything they were worked out from (the sources' settings, tables included, the times and
// the coupling) and handed out again while all of that is unchanged: a changed setting is seen
// at the next read, as when the sum is worked out for every read.
const std::vector<double>& sources_sum(const Session& s, double t_first, double dt, size_t n, bool ac) {
    struct Sum {
        double t_first = 0, dt = 0;
        bool ac = false;
        std::vector<signals::SourceParams> sources;
        std::vector<std::vector<int32_t>> tables;  // copies: the params' tables point here
        std::vector<double> values;
        uint64_t used = 0;
    };
    constexpr size_t kept = 4;  // AC and DC inputs, and trigger scans, without pushing each other out
    thread_local std::array<Sum, kept> sums;
    thread_local uint64_t uses = 0;

    const System& sys = state();
    const Measurement& m = s.measurement;
    thread_local std::vector<signals::SourceParams> active;
    active.clear();
    for (int module : s.modules) {
        for (const Channel& src : sys.modules[static_cast<size_t>(module)].sources) {
            if (src.active == code::on)
                active.push_back(source_params(src, m.sample_rate));
        }
    }
    const auto same = [&](const Sum& sum) {
        if (sum.values.size() != n || !same_bits(sum.t_first, t_first) || !same_bits(sum.dt, dt) ||
            sum.ac != ac || sum.sources.size() != active.size())
            return false;
        for (size_t i = 0; i < active.size(); ++i) {
            if (!signals::same_output(active[i], sum.sources[i]))
                return false;
        }
        return true;
    };
    ++uses;
    for (Sum& sum : sums) {
        if (same(sum)) {
            sum.used = uses;
            return sum.values;
        }
    }
    Sum& sum = *std::ranges::min_element(sums, {}, &Sum::used);
    sum.used = uses;
    sum.t_first = t_first;
    sum.dt = dt;
    sum.ac = ac;
    sum.sources = active;
    sum.tables.resize(active.size());
    for (size_t i = 0; i < active.size(); ++i) {
        sum.tables[i].assign(active[i].arb_table.begin(), active[i].arb_table.end());
        sum.sources[i].arb_table = sum.tables[i];
    }
    sum.values.assign(n, 0.0);
    thread_local std::vector<double> part;
    part.resize(n);
    for (const signals::SourceParams& p : active) {
        signals::render_source(p, t_first, dt, part, ac);
        for (size_t i = 0; i < n; ++i)
            sum.values[i] += part[i];
    }
    return sum.values;
}

// The earliest firing of the trigger inputs in samples from .. to - 1, carrying each input's
// hysteresis state along.
std::optional<int64_t> scan_inputs(Session& s, int64_t from, int64_t to) {
    Measurement& m = s.measurement;
    std::vector<std::pair<int32_t, const Channel*>> triggers;
    for (int32_t id : m.inputs) {
        const Channel* ch = channel_of(s, id);
        if (ch && ch->trigger_channel == code::on)
            triggers.emplace_back(id, ch);
    }
    if (triggers.empty() || from >= to)
        return std::nullopt;
    int64_t limit = static_cast<int64_t>(scan_limit_seconds * m.sample_rate);
    if (to - from > limit) {
        from = to - limit;
        m.trigger_armed.clear();
    }
    std::vector<double> chunk;
    for (int64_t start = from; start < to; start += scan_chunk) {
        int64_t n = std::min(scan_chunk, to - start);
        chunk.assign(static_cast<size_t>(n), 0.0);
        std::optional<int64_t> best;
        for (auto& [id, ch] : triggers) {
            render_input(s, id, start, chunk, false);
            double upper = ch->input.level_upper / 100.0 * ch->range;
            double lower = ch->input.level_lower / 100.0 * ch->range;
            bool positive = ch->input.trigger_slope == code::slope_positive;
            bool& armed = m.trigger_armed[id];
            std::optional<size_t> hit =
                ch->input.trigger_mode == code::trigger_bound
                    ? signals::find_bound_trigger(chunk, upper, lower, positive, armed)
                    : signals::find_level_trigger(chunk, upper, lower, positive, armed);
            if (hit && (!best || start + static_cast<int64_t>(*hit) < *best))
                best = start + static_cast<int64_t>(*hit);
        }
        if (best)
            return best;
    }
    return std::nullopt;
}

// The first trigger at or after search_from among the samples taken so far (now_n).
std::optional<int64_t> find_trigger(Session& s, int64_t now_n) {
    Measurement& m = s.measurement;
    const int64_t from = m.search_from;
    std::optional<int64_t> best;
    auto consider = [&](std::optional<int64_t> sample) {
        if (sample && *sample < now_n && (!best || *sample < *best))
            best = sample;
    };
    if (m.auto_trigger)
        consider(from);
    std::optional<int64_t> manual;
    if (m.manual_pending)
        manual = std::max(from, first_sample_at_or_after(m, m.manual_time));
    consider(manual);
    for (int32_t id : m.channels) {
        const Channel* ch = channel_of(s, id);
        if (!ch || ch->kind != ChannelKind::source || ch->trigger_channel != code::on ||
            ch->active != code::on)
            continue;
        double t = signals::next_period_start(source_params(*ch, m.sample_rate), m.t0 + from / m.sample_rate);
        if (std::isfinite(t))
            consider(std::max(from, first_sample_at_or_after(m, t)));
    }
    const int64_t scan_end = best ? *best : now_n;
    consider(scan_inputs(s, std::max(m.scanned_to, from), scan_end));
    m.scanned_to = std::max(m.scanned_to, scan_end);
    if (manual && best == manual)
        m.manual_pending = false;
    return best;
}

void keep_block(Measurement& m, int64_t start) {
    m.starts.push_back(start);
    ++m.completed;
    while (m.starts.size() > m.capacity) {
        m.starts.pop_front();
        ++m.first_number;
    }
}

}  // namespace

void start_measurement(Session& s, const std::vector<int32_t>& ids, double now) {
    Measurement& m = s.measurement;
    m = Measurement{};
    m.started = true;
    m.channels = ids;
    const Channel* lead = nullptr;
    for (int32_t id : ids) {
        const Channel* ch = channel_of(s, id);
        if (!ch)
            continue;
        if (ch->measure.arm_mode == code::arm_multi)
            m.multi_mainframe = true;
        if (ch->kind == ChannelKind::input && ch->active == code::on) {
            m.inputs.push_back(id);
            m.cursor[id] = 0;
            if (!lead)
                lead = ch;
        }
    }
    if (!lead && !ids.empty())
        lead = channel_of(s, ids.front());
    if (lead) {
        m.sample_rate = 2.56 * lead->measure.span;
        m.blocksize = lead->measure.blocksize;
        m.continuous = lead->measure.data_mode == code::data_continuous;
        m.auto_trigger = lead->measure.auto_trigger == code::auto_trigger_on;
        int32_t largest = state().modules[static_cast<size_t>(lead->module)].largest_blocksize;
        m.capacity = std::max<size_t>(2, static_cast<size_t>(2 * largest / m.blocksize));
    }
    if (!m.multi_mainframe)
        start_running(m, now);
}

void start_running(Measurement& m, double now) {
    m.running = true;
    m.t0 = now;
}

void advance(Session& s, double now) {
    Measurement& m = s.measurement;
    if (!m.running)
        return;
    const int64_t n = m.blocksize;
    const int64_t now_n = samples_taken(m, now);
    while (true) {
        if (m.continuous_from) {
            int64_t total = (now_n - *m.continuous_from) / n;
            if (total <= m.completed)
                return;
            int64_t first_new = std::max(m.completed, total - static_cast<int64_t>(m.capacity));
            if (first_new > m.completed) {
                m.starts.clear();
                m.first_number = first_new;
                m.completed = first_new;
            }
            for (int64_t k = m.completed; k < total; ++k)
                keep_block(m, *m.continuous_from + k * n);
            return;
        }
        if (!m.pending) {
            if (!m.searching)
                return;
            m.pending = find_trigger(s, now_n);
            if (!m.pending)
                return;
        }
        if (*m.pending + n > now_n)
            return;
        if (m.continuous) {
            m.continuous_from = m.pending;
            m.pending.reset();
            continue;
        }
        keep_block(m, *m.pending);
        m.pending.reset();
        m.searching = false;
        return;
    }
}

int64_t available_blocks(Session& s, const std::vector<int32_t>& ids, bool& overrun) {
    Measurement& m = s.measurement;
    std::optional<int64_t> fewest;
    for (int32_t id : ids) {
        auto c = m.cursor.find(id);
        if (c == m.cursor.end())
            continue;
        if (c->second < m.first_number) {
            c->second = m.first_number;
            overrun = true;
        }
        int64_t unread = m.completed - c->second;
        if (!fewest || unread < *fewest)
            fewest = unread;
    }
    return fewest.value_or(0);
}

void render_input(const Session& s, int32_t id, int64_t first, std::span<double> out, bool block_aligned) {
    const Measurement& m = s.measurement;
    const System& sys = state();
    auto exact = sys.input_samples.find(id);
    if (exact != sys.input_samples.end()) {
        // The samples repeat: copied in runs up to the end of the stored ones.
        const std::vector<double>& v = exact->second;
        const auto size = static_cast<int64_t>(v.size());
        const int64_t k = block_aligned ? 0 : first;
        auto from = static_cast<size_t>(((k % size) + size) % size);
        for (size_t done = 0; done < out.size();) {
            const size_t run = std::min(out.size() - done, v.size() - from);
            std::copy_n(v.begin() + static_cast<std::ptrdiff_t>(from), run,
                        out.begin() + static_cast<std::ptrdiff_t>(done));
            done += run;
            from = 0;
        }
        return;
    }
    const Channel* ch = channel_of(s, id);
    if (!ch) {
        std::fill(out.begin(), out.end(), 0.0);
        return;
    }
    const bool ac = ch->input.coupling == code::coupling_ac;
    const double dt = 1.0 / m.sample_rate;
    const double t_first = m.t0 + static_cast<double>(first) * dt;
    const std::vector<double>& sources = sources_sum(s, t_first, dt, out.size(), ac);
    std::copy(sources.begin(), sources.end(), out.begin());
    signals::add_input_noise(noise_seed(*ch, sys, input_index(*ch)),
                             static_cast<uint64_t>(std::max<int64_t>(0, first)),
                             signals::default_input_noise_rms, out);
    signals::clip(out, ch->range);
}

bool take_block(Session& s, int32_t id, double now, std::vector<double>& samples) {
    Measurement& m = s.measurement;
    bool overrun = false;
    if (available_blocks(s, {id}, overrun) < 1)
        return false;
    int64_t& cursor = m.cursor[id];
    int64_t start = m.starts[static_cast<size_t>(cursor - m.first_number)];
    samples.resize(static_cast<size_t>(m.blocksize));
    render_input(s, id, start, samples, true);
    ++cursor;
    if (!m.continuous && !m.searching && cursor == m.completed) {
        m.searching = true;
        m.search_from = std::max(start + m.blocksize, samples_taken(m, now));
        m.scanned_to = m.search_from;
        m.trigger_armed.clear();
    }
    return true;
}

}  // namespace sim
