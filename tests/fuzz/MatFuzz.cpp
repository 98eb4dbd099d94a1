// Operations on matrices beside the plain loops, bit for bit, also for numbers that are none.
#include <algorithm>
#include <kel/kelMat.h>

#include "Fuzz.h"
#include "MatOperations.h"

using kel_fuzz::Input;

namespace {

kelMat someMatrix(Input& input, int rows, int columns) {
    kelMat M(rows, columns, false);
    const uint8_t kind = input.byte();
    std::mt19937 random(input.word());
    for (int i = 0; i < rows * columns; ++i)
        M.m_Data[i] = kind % 2 ? input.number() : static_cast<float>(random() % 65536) / 16384.0f - 2.0f;
    for (int i = 0; i < kind / 2 % 8; ++i) // and a few numbers of another kind
        M.m_Data[static_cast<int>(random() % static_cast<unsigned>(rows * columns))] = input.number();
    return M;
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    using kel_test::MatOperation;
    Input input(data, size);
    const auto& list = kel_test::matOperations();
    const MatOperation& o = list[input.byte() % list.size()];
    const int rows = input.between(o.least, 40), columns = o.form == MatOperation::Any ? input.between(o.least, 15) : rows;
    kelMat A = someMatrix(input, rows, columns), B = someMatrix(input, rows, columns);
    if (o.form == MatOperation::Symmetric) {
        A = A + A.getTransposedMatrix();
        B = B * B.getTransposedMatrix();
    } else if (o.form == MatOperation::Square && input.byte() % 4 == 0) {
        A = A * A.getTransposedMatrix();
    }
    if (!kel_test::sameFloats(o.call(A, B), o.reference(kel_test::reference(A), kel_test::reference(B))))
        kel_fuzz::fail(o.name);
    return 0;
}
