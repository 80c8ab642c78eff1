#pragma once

#include <cstddef>
#include <span>

namespace kor::filters
{

/// Eigenvalues and eigenvectors of a symmetric matrix, all in single precision.
///
/// oMatrix  nSize x nSize elements; the lower triangle is read. It leaves as the eigenvectors by
///          rows, each of length 1 as far as single precision goes.
/// oValues  nSize elements, descending by absolute value; of equal ones the one found later comes
///          first. Row k of the matrix belongs to value k.
/// Sign     that which the method gives, times -1: it is part of the result.
/// Corners  a matrix of one element gives its value and the vector -1.
/// Errors   kor::DataException "Too many iteration in eigen vector calculation." when 30 steps do
///          not find a value, as with elements that are not numbers; its source fields are empty.
///          The contents of both are then not told.
/// Source   reduction to tridiagonal form: A. S. Householder, "Unitary triangularization of a
///          nonsymmetric matrix", Journal of the ACM 5(4), 339-342, 1958; R. S. Martin, C. Reinsch,
///          J. H. Wilkinson, "Householder's tridiagonalization of a symmetric matrix", Numerische
///          Mathematik 11, 181-195, 1968. QL with implicit shifts: A. Dubrulle, R. S. Martin,
///          J. H. Wilkinson, "The implicit QL algorithm", Numerische Mathematik 12, 377-383, 1968.
void SolveEigensystem(std::size_t nSize, std::span<float> oMatrix, std::span<float> oValues);

}  // namespace kor::filters
