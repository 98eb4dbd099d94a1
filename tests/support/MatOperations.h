// Every kernel of matrices once, with its plain reference: what unit tests, threads and fuzz targets go through.
#ifndef KEL_TESTS_MAT_OPERATIONS_H
#define KEL_TESTS_MAT_OPERATIONS_H

#include <kel/kelMat.h>
#include <string>
#include <vector>

#include "MatReference.h"

namespace kel_test {

using Reference = kel_ref::Matrix;
using Floats = std::vector<float>; // results of an operation, sizes and truth values included, one behind the other

struct MatOperation {
    const char* name;
    Floats (*call)(kelMat A, kelMat B);
    Floats (*reference)(Reference A, Reference B);
    enum Form { Any, Square, Symmetric } form; // of A; B is as wide and high, positive definite where A is symmetric
    int least;                                 // order that it is for, columns where rows may be more or fewer
};

const std::vector<MatOperation>& matOperations();

Reference reference(const kelMat& M);
inline const Reference& reference(const Reference& M) {
    return M;
}

// All of these one behind the other.
void append(Floats& all, double value);
void append(Floats& all, const Reference& M);
void append(Floats& all, const kelMat& M);
template <class T> void append(Floats& all, const std::vector<T>& values) {
    all.insert(all.end(), values.begin(), values.end());
}
template <class... Parts> Floats results(const Parts&... parts) {
    Floats all;
    (append(all, parts), ...);
    return all;
}

// Equal bits; any NaN equals any other.
bool sameFloat(float a, float b);
bool sameFloats(const Floats& a, const Floats& b);

} // namespace kel_test

#endif
