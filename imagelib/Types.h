#pragma once

#include <cstdint>
#include <vector>

#include "imagelib/ImageLibExport.h"

// Host value types: integer and float points, the framework's growable array and the
// Windows rectangle with its three helpers.

struct CPoint {
    int32_t x = 0;
    int32_t y = 0;
    CPoint() = default;
    CPoint(int32_t px, int32_t py) : x(px), y(py) {}
    bool operator==(const CPoint&) const = default;
};

struct SPoint {
    float x = 0.0f;
    float y = 0.0f;
    SPoint() = default;
    SPoint(float px, float py) : x(px), y(py) {}
    bool operator==(const SPoint&) const = default;
};

// The framework's CArray: a growable array addressed by index. Only the members the
// library uses are provided.
template <typename T>
class CArray {
public:
    int GetSize() const { return static_cast<int>(m_items.size()); }
    int GetCount() const { return GetSize(); }
    bool IsEmpty() const { return m_items.empty(); }
    void SetSize(int n) { m_items.resize(n > 0 ? static_cast<size_t>(n) : 0); }
    int Add(const T& item) { m_items.push_back(item); return GetSize() - 1; }
    void RemoveAll() { m_items.clear(); }
    void RemoveAt(int index, int count = 1) {
        m_items.erase(m_items.begin() + index, m_items.begin() + index + count);
    }
    T& operator[](int i) { return m_items[static_cast<size_t>(i)]; }
    const T& operator[](int i) const { return m_items[static_cast<size_t>(i)]; }
    T& GetAt(int i) { return m_items[static_cast<size_t>(i)]; }
    const T& GetAt(int i) const { return m_items[static_cast<size_t>(i)]; }
    T* GetData() { return m_items.data(); }
    const T* GetData() const { return m_items.data(); }
    auto begin() { return m_items.begin(); }
    auto end() { return m_items.end(); }
    auto begin() const { return m_items.begin(); }
    auto end() const { return m_items.end(); }

private:
    std::vector<T> m_items;
};

// The Windows rectangle: right and bottom are exclusive.
struct RECT {
    int32_t left = 0;
    int32_t top = 0;
    int32_t right = 0;
    int32_t bottom = 0;
    bool operator==(const RECT&) const = default;
};

// Empty means no area: right <= left or bottom <= top.
CIMAGE_API bool IsRectEmpty(const RECT* r);
// Sets all four fields to 0.
CIMAGE_API bool SetRectEmpty(RECT* r);
// dst = the overlap of a and b. When the larger left is not below the smaller right, or the
// larger top is not below the smaller bottom (touching edges do not overlap), dst is made
// empty and the result is false.
CIMAGE_API bool IntersectRect(RECT* dst, const RECT* a, const RECT* b);
// dst = the smallest rectangle holding both; an empty operand is ignored. False when both
// are empty (dst is then made empty).
CIMAGE_API bool UnionRect(RECT* dst, const RECT* a, const RECT* b);
