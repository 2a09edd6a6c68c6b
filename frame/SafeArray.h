#pragma once

#include <cstdint>
#include <cstring>
#include <new>

#include "frame/Errors.h"
#include "imagelib/Trace.h"

// An owned, zero-filled array. Indexing is unchecked: callers keep indexes below count().
template <typename T>
class CSafeArray {
public:
    CSafeArray() = default;
    explicit CSafeArray(uint32_t count) { init(count); }
    CSafeArray(const CSafeArray&) = delete;
    CSafeArray& operator=(const CSafeArray&) = delete;
    ~CSafeArray() { free(); }

    // Drops the previous elements, then holds max(count, 1) zeroed elements and reports
    // `count` (so init(0) keeps one element but reports 0). Throws CSafeArrayErrorT when
    // the elements cannot be allocated.
    void init(uint32_t count) {
        free();
        try {
            m_data = new T[count > 0 ? count : 1]();
        } catch (const std::bad_alloc& failure) {
            Trace(L"CSafeArray::init: allocation failed. Error %.500s\n", failure.what());
            throw CSafeArrayErrorT();
        }
        m_count = count;
    }
    void free() {
        delete[] m_data;
        m_data = nullptr;
        m_count = 0;
    }

    T& operator[](size_t i) { return m_data[i]; }
    const T& operator[](size_t i) const { return m_data[i]; }
    T* data() { return m_data; }
    const T* data() const { return m_data; }
    uint32_t count() const { return m_count; }

private:
    T* m_data = nullptr;
    uint32_t m_count = 0;
};
