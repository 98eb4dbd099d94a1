// Reduction of four-byte pixels: every input is repeated `repeat` times, every `box` of those are averaged, rounding down; rows
// first, then columns of such rows. Rests on kernels for the usual boxes and on plain sums for those beyond.
#include <algorithm>

#include "kelDivision.h"
#include "kelImage_Kernels.h"
#include "kelImage_Private.h"
#include "kelImage_Resize.h"

namespace {

using kel::allocate;
using kel::Buffer;
using kel::Kernels;
using kel::rowByWidth;

// Weights of boxes up to here are bytes, up to there words; the kernels say why.
constexpr int64_t kByteBox = 16, kWordBox = 2 * 4103;

// The inputs under one output: the first counts `head` times, the last `tail` times, those between `repeat` times. Where one
// input alone is under the box, head is the whole box and tail 0.
struct Box {
    kelValue_s32 first, last;
    int64_t head, tail;
};

struct Ratio {
    int64_t repeat, box;

    // A box of one is taken as two of the same input twice: its reciprocal would be too large for the kernels, to which boxes beyond
    // bytes have to be even.
    Ratio(kelValue_s32 outputs, kelValue_s32 inputs) : repeat(outputs), box(inputs) {
        const kelValue_s32 common = kel::divisor(kel::gcd(outputs, inputs));
        const int twice = inputs == common || box / common > kByteBox ? 2 : 1;
        repeat = repeat / common * twice;
        box = kel::divisor(box / common * twice);
    }
    bool isHalf() const { return repeat == 1 && box == 2; }
    Box at(kelValue_s32 output) const {
        const int64_t begin = output * box, end = begin + box;
        const int64_t first = begin / repeat, last = (end - 1) / repeat;
        const int64_t head = std::min((first + 1) * repeat, end) - begin;
        return {static_cast<kelValue_s32>(first), static_cast<kelValue_s32>(last), head,
                first == last ? 0 : end - last * repeat};
    }
    int64_t weight(const Box& at, kelValue_s32 input) const { // 0 for inputs behind the last
        return input == at.first ? at.head : input < at.last ? repeat : input == at.last ? at.tail : 0;
    }
    // Groups of so many inputs under a box at most: under one that begins with the last share of an input.
    kelValue_s32 groups(kelValue_s32 inputs) const {
        const int64_t share = (repeat | box) % 2 == 0 ? 2 : 1, // as the constructor leaves them
            most = repeat > 0 ? (repeat - share + box - 1) / repeat + 1 : 0;
        return static_cast<kelValue_s32>((most + inputs - 1) / inputs);
    }
};

// Rows of inputs to rows of outputs.
class Across {
public:
    Across(const Kernels& kernels, kelValue_s32 outputs, kelValue_s32 inputs)
        : m_ratio(outputs, inputs), m_outputs(outputs), m_pitch(kel::wholeFours(outputs)),
          m_together(m_ratio.box > kByteBox ? 4 : 2), m_groups(m_ratio.groups(m_together)),
          m_reduce(inputs < m_together || m_ratio.box > kWordBox ? nullptr
                   : m_together == 4                             ? kernels.reduceAcrossByWords
                                                                 : kernels.reduceAcrossByBytes) {
        if (m_reduce)
            fillTables(inputs);
    }
    void operator()(uint32_t* to, const uint32_t* from) const {
        if (m_reduce)
            return m_reduce(to, from, m_index.get(), m_weights.get(), m_groups, m_pitch, static_cast<uint32_t>(m_ratio.box));
        for (kelValue_s32 i = 0; i < m_outputs; ++i)
            to[i] = plainAverage(from, m_ratio.at(i));
    }

private:
    // Every group of inputs of every output: where it starts, and its weights side by side, bytes of a pair or words of either half
    // of four inputs, four times. The last input comes as the last of its group, so that nothing behind it is read.
    void fillTables(kelValue_s32 inputs) {
        const ptrdiff_t count = m_groups * m_pitch;
        m_index = allocate<int32_t>(count);
        m_weights = allocate<uint16_t>((m_together == 4 ? 16 : 4) * count);
        for (ptrdiff_t i = 0; i < count; ++i) {
            const Box box = m_ratio.at(static_cast<kelValue_s32>(std::min<ptrdiff_t>(i % m_pitch, m_outputs - 1)));
            const int64_t wanted = box.first + m_together * (i / m_pitch),
                          index = std::min<int64_t>(wanted, inputs - m_together);
            const auto weight = [&](int64_t k) {
                return static_cast<uint16_t>(k < wanted ? 0 : m_ratio.weight(box, static_cast<kelValue_s32>(k)));
            };
            m_index[i] = static_cast<int32_t>(index);
            if (m_together == 2)
                std::fill_n(&m_weights[4 * i], 4, static_cast<uint16_t>(weight(index) | weight(index + 1) << 8));
            else
                for (ptrdiff_t half = 0; half < 2; ++half)
                    for (ptrdiff_t k = 0; k < 8; ++k)
                        m_weights[8 * (i + (i / m_pitch + half) * m_pitch) + k] = weight(index + 2 * half + k % 2);
        }
    }
    uint32_t plainAverage(const uint32_t* from, const Box& box) const {
        uint32_t result = 0;
        for (int shift = 0; shift < 32; shift += 8) {
            int64_t sum = 0;
            for (kelValue_s32 k = box.first; k <= box.last; ++k)
                sum += m_ratio.weight(box, k) * (from[k] >> shift & 0xff);
            result |= static_cast<uint32_t>(sum / m_ratio.box) << shift;
        }
        return result;
    }

    Ratio m_ratio;
    kelValue_s32 m_outputs;
    ptrdiff_t m_pitch;
    kelValue_s32 m_together, m_groups; // inputs of a group, groups of an output
    kel::ReduceAcross m_reduce;
    Buffer<int32_t> m_index;
    Buffer<uint16_t> m_weights;
};

// Rows to one row, byte by byte.
class Down {
public:
    Down(const Kernels& kernels, kelValue_s32 outputs, kelValue_s32 inputs)
        : m_ratio(outputs, inputs), m_rows(2 * m_ratio.groups(2)), m_row(allocate<const uint8_t*>(m_rows)),
          m_weights(allocate<uint16_t>(m_rows)), m_reduce(m_ratio.box > kWordBox   ? nullptr
                                                          : m_ratio.box > kByteBox ? kernels.reduceDownByWords
                                                                                   : kernels.reduceDownByBytes) {}
    kelValue_s32 rows() const { return m_rows; } // under a box at most, by pairs
    kelValue_s32 lastOf(kelValue_s32 output) const { return m_ratio.at(output).last; }

    template <class RowAt> void operator()(uint8_t* to, kelValue_s32 output, ptrdiff_t bytes, RowAt rowAt) {
        const Box box = m_ratio.at(output);
        const kelValue_s32 pairs = (box.last - box.first) / 2 + 1;
        for (kelValue_s32 k = 0; k < 2 * pairs; ++k) { // behind the last, that one again without any weight
            m_row[k] = reinterpret_cast<const uint8_t*>(rowAt(std::min(box.first + k, box.last)));
            m_weights[k] = static_cast<uint16_t>(m_ratio.weight(box, box.first + k));
        }
        if (m_reduce)
            return m_reduce(to, m_row.get(), m_weights.get(), pairs, bytes, static_cast<uint32_t>(m_ratio.box));
        for (ptrdiff_t i = 0; i < bytes; ++i) {
            int64_t sum = 0;
            for (kelValue_s32 k = box.first; k <= box.last; ++k)
                sum += m_ratio.weight(box, k) * m_row[k - box.first][i];
            to[i] = static_cast<uint8_t>(sum / m_ratio.box);
        }
    }

private:
    Ratio m_ratio;
    kelValue_s32 m_rows;
    Buffer<const uint8_t*> m_row;
    Buffer<uint16_t> m_weights;
    kel::ReduceDown m_reduce;
};

// Two to one both ways, the ratio of pyramids, without rows in between.
void halveBothWays(const Kernels& kernels, kelImage_t* dst, const kelImage_t* src) {
    for (kelValue_s32 y = 0; y < dst->height; ++y)
        kernels.halveBothWays(rowByWidth<uint32_t>(dst, y), rowByWidth<uint32_t>(src, 2 * y),
                              rowByWidth<uint32_t>(src, 2 * y + 1), dst->width);
}

} // namespace

void kel::reduce(kelImage_t* dst, const kelImage_t* src) {
    const Kernels& kernels = kel::kernels();
    if (Ratio(dst->width, src->width).isHalf() && Ratio(dst->height, src->height).isHalf())
        return ::halveBothWays(kernels, dst, src);
    const Across across(kernels, dst->width, src->width);
    Down down(kernels, dst->height, src->height);
    // A ring of reduced rows, large enough for those under one box.
    const ptrdiff_t pitch = wholeFours(dst->width);
    Buffer<uint32_t> ring = allocate<uint32_t>(down.rows() * pitch);
    const auto rowAt = [&](kelValue_s32 k) { return ring.get() + k % down.rows() * pitch; };
    kelValue_s32 reduced = 0; // source rows that have passed through the ring
    for (kelValue_s32 y = 0; y < dst->height; ++y) {
        for (; reduced <= down.lastOf(y); ++reduced)
            across(rowAt(reduced), rowByWidth<uint32_t>(src, reduced));
        down(reinterpret_cast<uint8_t*>(rowByWidth<uint32_t>(dst, y)), y, 4 * static_cast<ptrdiff_t>(dst->width), rowAt);
    }
}
