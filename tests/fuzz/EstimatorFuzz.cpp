// Operations on sets of pairs beside their references: with equal seeds they draw alike and give equal bits.
#include "Correspondences.h"
#include "Fuzz.h"

using kel_fuzz::Input;

namespace {

// Pairs that a transform relates, some coordinates of any kind, or few places: degenerate samples.
template <class Kind> typename Kind::Set somePairs(Input& input) {
    std::mt19937 random(input.word());
    const uint8_t kind = input.byte();
    typename Kind::Set set =
        kel_test::pairs<Kind>(input.between(0, 60), kind % 3 ? 2.0f : 0.0f, static_cast<float>(kind) / 256, random);
    for (auto values : Kind::kCoordinates)
        for (float& value : set.*values)
            value = kind % 8 == 0 ? input.number() : kind % 8 == 1 ? std::round(value / 300) : value;
    return set;
}

template <class Kind> void operation(Input& input) {
    const auto& list = kel_test::setOperations<Kind>();
    const auto& o = list[input.byte() % list.size()];
    typename Kind::Set set = somePairs<Kind>(input);
    const float threshold = static_cast<float>(input.byte()) / 16.0f;
    typename Kind::Estimator M;
    for (int i = 0; i < 3 * Kind::kColumns; ++i)
        M.m_Data[i] = input.number();
    if (!kel_test::agrees<Kind>(o, set, M, threshold))
        kel_fuzz::fail(o.name);
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    Input input(data, size);
    (input.byte() % 2 ? operation<kel_test::Plane> : operation<kel_test::Space>)(input);
    return 0;
}
