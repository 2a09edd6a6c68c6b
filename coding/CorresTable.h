#pragma once

#include "frame/Errors.h"
#include "frame/VarnothExport.h"
#include "imagelib/CImage.h"
#include "imagelib/Types.h"

// A table of match weights between a window around one point of an 8-bit image `a` and
// windows around every point of a square search area in a second 8-bit image `b`.
// The table has side 2 * radius + 1 and is addressed by one flat index; after BuildTable
// its entries are scores divided by their total, so they act as weights.
class VARNOTH_API CCorresTable {
public:
    CCorresTable() = default;
    // Throws CCorresTableInitErrT when Init fails (a negative radius, or no memory).
    CCorresTable(int radius, int window);
    ~CCorresTable();

    // The table owns its array and is never copied; it may be moved.
    CCorresTable(const CCorresTable&) = delete;
    CCorresTable& operator=(const CCorresTable&) = delete;
    CCorresTable(CCorresTable&& other) noexcept;
    CCorresTable& operator=(CCorresTable&& other) noexcept;

    // Sizes the table for `radius` with all entries 0.0 and keeps `window` as the half-size
    // of the correlation window. A negative radius changes nothing and gives false; false
    // also when the array cannot be allocated.
    bool Init(int radius, int window);

    // Scores the window of half-size m_nWindow around p in `a` against the windows around
    // every point of the search area centred on c = p + q in `b` (q: the predicted
    // displacement of p), then divides the entries by their total. Does nothing (and leaves
    // the table unbuilt) when c's window does not fit in `a`, when there is no table, or when
    // either image is not 8-bit.
    void BuildTable(CImage& a, CImage& b, CPoint p, CPoint q);

    // Mean product of the windows of half-size n around pa in `a` and pb in `b`, over the
    // offsets that keep both points inside their images; 0.0 when no offset does.
    static float CorrelationCalc(CImage& a, CImage& b, CPoint& pa, CPoint& pb, int n);

    // out[i] = other[i] + this[i] when all three tables exist and share one radius;
    // otherwise nothing happens. `out` may be this table or `other`.
    void SumTables(const CCorresTable& other, CCorresTable& out) const;

    // Entry `index` of the flat table; 0.0 for an index outside the table or without one.
    float GetTable(int index) const;
    int GetRadius() const { return m_nRadius; }
    // Whether the last BuildTable ran its search (cleared by Init).
    bool IsBuilt() const { return m_bBuilt; }
    // Number of entries, (2 * radius + 1)^2, or 0 without a table.
    long long GetEntryCount() const;

private:
    void Release();

    float* m_pTable = nullptr;
    int m_nRadius = 0;
    int m_nWindow = 0;
    bool m_bBuilt = false;
};
