#pragma once

#include <cmath>
#include <cstdint>
#include <utility>
#include <vector>

// Small dense row-major matrix, float or int; used as 3 x 1 colour vectors and for 2 x 2
// inverses. A matrix owns its elements; the "view" fields address them (the whole array
// after construction).
namespace ZentMatrix {

template <typename T>
class CMatrix {
public:
    CMatrix(uint32_t rows, uint32_t cols, T fill = T(0), T diagonal = T(0)) { allocate(rows, cols); set(fill, diagonal); }
    CMatrix(const CMatrix& other) { copyFrom(other); }
    CMatrix& operator=(const CMatrix& other) {
        if (this != &other) {
            release();
            copyFrom(other);
        }
        return *this;
    }
    virtual ~CMatrix() { release(); }

    uint32_t rows() const { return m_viewRows; }
    uint32_t cols() const { return m_viewCols; }
    T& operator()(uint32_t r, uint32_t c) { return m_view[r * m_rowStep + c * m_colStep]; }
    const T& operator()(uint32_t r, uint32_t c) const { return m_view[r * m_rowStep + c * m_colStep]; }
    // Element i of the view taken as a column vector of consecutive elements.
    T& operator[](uint32_t i) { return m_view[i]; }
    const T& operator[](uint32_t i) const { return m_view[i]; }

    // Every element = fill, then the first min(rows, cols) diagonal elements = diagonal.
    void set(T fill, T diagonal) {
        for (uint32_t r = 0; r < m_viewRows; ++r)
            for (uint32_t c = 0; c < m_viewCols; ++c) (*this)(r, c) = fill;
        const uint32_t n = m_viewRows < m_viewCols ? m_viewRows : m_viewCols;
        for (uint32_t r = 0; r < n; ++r) (*this)(r, r) = diagonal;
    }
    void scale(T s) {
        for (uint32_t r = 0; r < m_viewRows; ++r)
            for (uint32_t c = 0; c < m_viewCols; ++c) (*this)(r, c) *= s;
    }
    // Sum over i below the row count of element i of both, as column vectors.
    float dot(const CMatrix& other) const {
        float sum = 0.0f;
        for (uint32_t i = 0; i < m_viewRows; ++i) sum += static_cast<float>(m_view[i] * other.m_view[i]);
        return sum;
    }

    // Inverse by LU decomposition with partial pivoting, written into target (which may be
    // this matrix). Returns false, leaving target unchanged, when the view is not square or
    // a pivot's magnitude is below 1e-20.
    bool inverse(CMatrix& target) const;

private:
    void allocate(uint32_t rows, uint32_t cols) {
        m_rows = m_viewRows = rows;
        m_cols = m_viewCols = cols;
        const size_t n = static_cast<size_t>(rows) * cols;
        m_data = new T[n > 0 ? n : 1]();
        m_view = m_data;
        m_last = m_data + (n > 0 ? n - 1 : 0);
        m_reserved = 0;
        m_colStep = 1;
        m_rowStep = cols;
    }
    void copyFrom(const CMatrix& other) {
        allocate(other.m_viewRows, other.m_viewCols);
        for (uint32_t r = 0; r < m_viewRows; ++r)
            for (uint32_t c = 0; c < m_viewCols; ++c) (*this)(r, c) = other(r, c);
    }
    void release() {
        delete[] m_data;
        m_rows = m_cols = m_viewRows = m_viewCols = 0;
        m_data = m_view = m_last = nullptr;
        m_reserved = 0;
        m_colStep = m_rowStep = 0;
    }

    uint32_t m_rows = 0, m_cols = 0;
    uint32_t m_viewRows = 0, m_viewCols = 0;
    T* m_data = nullptr;
    T* m_view = nullptr;
    T* m_last = nullptr;
    int32_t m_reserved = 0;
    uint32_t m_colStep = 1;
    uint32_t m_rowStep = 0;
};

template <typename T>
bool CMatrix<T>::inverse(CMatrix& target) const {
    if (m_viewRows != m_viewCols) return false;
    const uint32_t n = m_viewRows;
    const T tiny = static_cast<T>(1e-20);
    CMatrix lu(*this);  // L below the diagonal (unit diagonal implied), U on and above it
    CMatrix<int32_t> perm(n, 1);
    for (uint32_t i = 0; i < n; ++i) perm(i, 0) = static_cast<int32_t>(i);

    for (uint32_t j = 0; j < n; ++j) {
        uint32_t pivot = j;
        for (uint32_t r = j + 1; r < n; ++r)
            if (std::abs(lu(r, j)) > std::abs(lu(pivot, j))) pivot = r;
        if (pivot != j) {
            for (uint32_t c = 0; c < n; ++c) std::swap(lu(j, c), lu(pivot, c));
            std::swap(perm(j, 0), perm(pivot, 0));
        }
        for (uint32_t i = 0; i < j; ++i) {
            if (std::abs(lu(i, i)) < tiny) return false;
            T sum = T(0);
            for (uint32_t k = 0; k < i; ++k) sum += lu(j, k) * lu(k, i);
            lu(j, i) = (lu(j, i) - sum) / lu(i, i);
        }
        for (uint32_t c = j; c < n; ++c) {
            T sum = T(0);
            for (uint32_t k = 0; k < j; ++k) sum += lu(j, k) * lu(k, c);
            lu(j, c) = lu(j, c) - sum;
        }
    }
    if (n > 0 && std::abs(lu(n - 1, n - 1)) < tiny) return false;

    CMatrix result(n, n);
    std::vector<T> y(n), x(n);
    for (uint32_t c = 0; c < n; ++c) {
        CMatrix unit(n, 1);
        unit(c, 0) = T(1);
        for (uint32_t i = 0; i < n; ++i) {  // forward substitution on the permuted unit vector
            T sum = T(0);
            for (uint32_t k = 0; k < i; ++k) sum += lu(i, k) * y[k];
            y[i] = unit(static_cast<uint32_t>(perm(i, 0)), 0) - sum;
        }
        for (uint32_t i = n; i-- > 0;) {  // back substitution
            T sum = T(0);
            for (uint32_t k = i + 1; k < n; ++k) sum += lu(i, k) * x[k];
            x[i] = (y[i] - sum) / lu(i, i);
        }
        for (uint32_t i = 0; i < n; ++i) result(i, c) = x[i];
    }
    target = result;
    return true;
}

}  // namespace ZentMatrix
