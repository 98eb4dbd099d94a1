// A call of an image operation of the list: how it is made, and the images that it is made on.
#ifndef KEL_TESTS_IMAGE_SCENE_H
#define KEL_TESTS_IMAGE_SCENE_H

#include <cfenv>
#include <climits>
#include <cstdlib>
#include <optional>

#include "GuardedImage.h"
#include "ImageOperations.h"
#include "PointReference.h"
#include "TransformReference.h"
#include "Valgrind.h"

namespace kel_test {

// How one call is made.
struct Setting {
    Size src;
    int parameter = 0;
    Guard guard = Guard::Behind;
    Fill fill = Fill::Random;
    bool inPlace = false;
    int half = -1;           // columns that it is wider than it has to be; negative for null
    Size dst = {INT_MIN, 0}; // where it is not what the operation makes of the source's
    ptrdiff_t spare = 0;     // bytes behind the data; negative where rows end with their last pixel
    Size scratch = {0, 0};   // columns and rows that the scratch image has more than the source
    size_t behindScratch = 0;
};

inline std::ostream& operator<<(std::ostream& out, const Setting& s) {
    return out << s.src.width << "x" << s.src.height << ", parameter " << s.parameter << ", fill " << static_cast<int>(s.fill)
               << (s.inPlace ? ", in place" : "") << (s.half < 0 ? "" : ", with half");
}

inline Size sizeOfDst(const ImageOperation& o, const Setting& s) {
    return s.dst.width == INT_MIN ? o.size(s.src, s.parameter) : s.dst;
}
inline bool isDefined(const ImageOperation& o, const Setting& s) {
    const Size dst = sizeOfDst(o, s);
    return std::min(s.src.width, dst.width) >= o.leastWidth && dst.height >= 0;
}

// The images of a call, the same contents every time.
class Scene {
public:
    Scene(const ImageOperation& o, const Setting& s, int type) : Scene(o, s, type, sizeOfDst(o, s)) {}
    Scene(const ImageOperation& o, const Setting& s, int type, Size dst)
        : m_operation(o), m_setting(s), m_src(s.src.width, s.src.height, type, s.guard, o.behind + spare(s.src.width, type)),
          m_dst(dst.width, dst.height, type == o.from ? o.to : type, s.guard,
                roomFor(o, dst) / o.room * (o.room - 1) + spare(dst.width, o.to)) {
        if (s.fill != Fill::Random)
            m_src.fill(s.fill, 5);
        if (o.tmp != kNoType)
            m_tmp.emplace(s.src.width + s.scratch.width, s.src.height + s.scratch.height, o.tmp, s.guard, s.behindScratch);
        if (s.half >= 0)
            m_half.emplace((std::max(s.src.width, 0) + 1) / 2 + s.half, (s.src.height + 1) / 2, 0, s.guard);
    }
    void apply(const ImageCall& call) const {
        call({m_setting.inPlace ? m_src.get() : m_dst.get(), m_src.get(), m_tmp ? m_tmp->get() : nullptr,
              m_half ? m_half->get() : nullptr, m_setting.parameter});
    }
    // Calls f(image) for every image of the call.
    template <class F> void forEach(F f) const {
        f(m_dst);
        f(m_src);
        for (const auto* image : {&m_tmp, &m_half})
            if (*image)
                f(**image);
    }
    testing::AssertionResult equals(const Scene& other) const {
        if (auto result = holds(m_dst, other.m_dst.bytes()); !result)
            return result;
        if (auto result = holds(m_src, other.m_src.bytes()); !result)
            return result << " (source)";
        if (auto result = m_tmp ? holds(*m_tmp, other.m_tmp->bytes()) : testing::AssertionSuccess(); !result)
            return result << " (scratch)";
        return m_half ? holds(*m_half, other.m_half->bytes()) << " (half)" : testing::AssertionSuccess();
    }

    // All but the source's pixels.
    void makeIndeterminate() const {
        VALGRIND_MAKE_MEM_UNDEFINED(m_dst.data(), m_dst.size());
        if (m_tmp)
            VALGRIND_MAKE_MEM_UNDEFINED(m_tmp->data(), m_tmp->size());
        const int bytes = m_src->channels * m_src->depth;
        for (int y = 0; y < m_src->height; ++y)
            VALGRIND_MAKE_MEM_UNDEFINED(m_src.data() + (y * m_src->step + m_src->width) * bytes,
                                        (m_src->step - m_src->width) * bytes);
    }
    bool isSettled() const {
        const int bytes = m_dst->channels * m_dst->depth;
        const auto& margin = m_operation.settled;
        for (int y = margin.top; y < m_dst->height - margin.bottom; ++y)
            if (VALGRIND_CHECK_MEM_IS_DEFINED(m_dst.data() + (y * m_dst->step + margin.left) * bytes,
                                              (m_dst->width - margin.left - margin.right) * bytes) != 0)
                return false;
        return true;
    }

private:
    size_t spare(int width, int type) const {
        if (m_setting.spare >= 0)
            return static_cast<size_t>(m_setting.spare);
        return size_t(0) - static_cast<size_t>((kel_ref::wholeBlocks(width) - width) * kel_ref::wholePixelBytes(type));
    }

    const ImageOperation& m_operation;
    const Setting m_setting;
    Image m_src, m_dst;
    std::optional<Image> m_tmp, m_half;
};

// Whether an operation and its reference make the same of the same images, and draw as often, where they are defined for them.
inline testing::AssertionResult agrees(const ImageOperation& o, const Setting& setting, int rounding = FE_TONEAREST) {
    if (!isDefined(o, setting))
        return testing::AssertionSuccess();
    const Scene actual(o, setting, o.from), expected(o, setting, o.from);
    std::fesetround(rounding);
    srand(42);
    expected.apply(o.reference);
    const int next = rand();
    srand(42);
    actual.apply(o.call);
    std::fesetround(FE_TONEAREST);
    if (rand() != next)
        return testing::AssertionFailure() << "another number of draws, " << setting;
    return actual.equals(expected) << ", " << setting;
}

} // namespace kel_test

#endif
