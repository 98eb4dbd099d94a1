// The choice among tables of kernels by what the processor has.
#ifndef KEL_INSTRUCTION_SET_H
#define KEL_INSTRUCTION_SET_H

// KEL_TABLE(name): the table of that name of the widest instruction set here.
#if defined(KEL_KERNELS) // one table whatever the processor, for tests and measurements
#define KEL_TABLE(name) KEL_KERNELS::name
#elif defined(__aarch64__) // NEON is part of the architecture
#define KEL_TABLE(name) neon::name
#else
#define KEL_TABLE(name) widest(sse41::name, avx2::name, avx512::name)

namespace kel {

// AVX-512 (F, BW, VL and VBMI), AVX2 and FMA, or what every x86 processor has that kel runs on.
template <class Table> const Table& widest(const Table& sse41, const Table& avx2, const Table& avx512) {
    if (__builtin_cpu_supports("avx512bw") && __builtin_cpu_supports("avx512vl") && __builtin_cpu_supports("avx512vbmi"))
        return avx512;
    return __builtin_cpu_supports("avx2") && __builtin_cpu_supports("fma") ? avx2 : sse41;
}

} // namespace kel
#endif

#endif
