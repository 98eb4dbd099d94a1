// The choice among tables of kernels by what the processor has.
#ifndef KEL_INSTRUCTION_SET_H
#define KEL_INSTRUCTION_SET_H

namespace kel {

// The table of the widest instruction set here: AVX-512 (F, BW, VL and VBMI), AVX2, or what every processor has that kel runs on.
template <class Table> const Table& widest(const Table& sse41, const Table& avx2, const Table& avx512) {
    if (__builtin_cpu_supports("avx512bw") && __builtin_cpu_supports("avx512vl") && __builtin_cpu_supports("avx512vbmi"))
        return avx512;
    return __builtin_cpu_supports("avx2") ? avx2 : sse41;
}

} // namespace kel

#endif
