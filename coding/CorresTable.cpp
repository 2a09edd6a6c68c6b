#include "coding/CorresTable.h"

#include <algorithm>
#include <cstdint>
#include <new>
#include <utility>

#include "coding/CorresTableInternal.h"

namespace {

long long SideOf(int radius) { return 2LL * radius + 1; }

}  // namespace

CCorresTable::CCorresTable(int radius, int window) {
    if (!Init(radius, window)) throw CCorresTableInitErrT();
}

CCorresTable::~CCorresTable() { Release(); }

CCorresTable::CCorresTable(CCorresTable&& other) noexcept
    : m_pTable(std::exchange(other.m_pTable, nullptr)),
      m_nRadius(std::exchange(other.m_nRadius, 0)),
      m_nWindow(std::exchange(other.m_nWindow, 0)),
      m_bBuilt(std::exchange(other.m_bBuilt, false)) {}

CCorresTable& CCorresTable::operator=(CCorresTable&& other) noexcept {
    if (this != &other) {
        Release();
        m_pTable = std::exchange(other.m_pTable, nullptr);
        m_nRadius = std::exchange(other.m_nRadius, 0);
        m_nWindow = std::exchange(other.m_nWindow, 0);
        m_bBuilt = std::exchange(other.m_bBuilt, false);
    }
    return *this;
}

void CCorresTable::Release() {
    delete[] m_pTable;
    m_pTable = nullptr;
}

long long CCorresTable::GetEntryCount() const {
    return m_pTable != nullptr ? SideOf(m_nRadius) * SideOf(m_nRadius) : 0;
}

bool CCorresTable::Init(int radius, int window) {
    if (radius < 0) return false;
    m_nRadius = radius;
    Release();
    const long long side = SideOf(radius);
    try {
        m_pTable = new float[static_cast<size_t>(side * side)]();
    } catch (const std::bad_alloc&) {
        m_pTable = nullptr;
    }
    m_nWindow = window;
    // The fresh entries are no longer the result of a search.
    m_bBuilt = false;
    return m_pTable != nullptr;
}

float CCorresTable::CorrelationCalc(CImage& a, CImage& b, CPoint& pa, CPoint& pb, int n) {
    return varnoth::coding::CorrelationScore(a, b, pa, pb, n);
}

void CCorresTable::BuildTable(CImage& a, CImage& b, CPoint p, CPoint q) {
    m_bBuilt = false;
    const int n = m_nWindow;
    const long long r = m_nRadius;
    // The centre is checked against a (not b): its window must fit in a.
    const long long cx = static_cast<long long>(p.x) + q.x;
    const long long cy = static_cast<long long>(p.y) + q.y;
    if (cy - n < 0 || cy + n >= a.GetHeight() || cx - n < 0 || cx + n >= a.GetWidth()) return;
    if (m_pTable == nullptr || a.GetBitCount() != 8 || b.GetBitCount() != 8) return;

    const long long entries = GetEntryCount();
    std::fill(m_pTable, m_pTable + entries, 1.0f);

    // The search area clipped by b; its scores are packed from index 0, rows outer.
    varnoth::coding::SearchArea area;
    area.vLo = static_cast<int>(std::max(cy - r, 0LL));
    area.vHi = static_cast<int>(std::min(cy + r, static_cast<long long>(b.GetHeight()) - 1));
    area.uLo = static_cast<int>(std::max(cx - r, 0LL));
    area.uHi = static_cast<int>(std::min(cx + r, static_cast<long long>(b.GetWidth()) - 1));
    const long long count = static_cast<long long>(area.Rows()) * area.Columns();
    if (count > 0) varnoth::coding::ScoreSearchArea(a, b, p, area, n, m_pTable);

    float sum = 0.0f;
    for (long long i = 0; i < count; ++i) sum += m_pTable[i];
    // The entries left at 1.0 count into the total as well.
    sum += static_cast<float>(entries - count);
    if (sum > 0.0f) {
        for (long long i = 0; i < entries; ++i) {
            if (m_pTable[i] == 0.0f) m_pTable[i] = 1.0f;
            m_pTable[i] /= sum;
        }
    }
    m_bBuilt = true;
}

void CCorresTable::SumTables(const CCorresTable& other, CCorresTable& out) const {
    if (m_nRadius != other.m_nRadius || m_nRadius != out.m_nRadius) return;
    // Tables of one radius whose array is missing (never sized, or out of memory) are refused.
    if (m_pTable == nullptr || other.m_pTable == nullptr || out.m_pTable == nullptr) return;
    const long long entries = GetEntryCount();
    for (long long i = 0; i < entries; ++i) out.m_pTable[i] = other.m_pTable[i] + m_pTable[i];
}

float CCorresTable::GetTable(int index) const {
    if (index < 0 || index >= GetEntryCount()) return 0.0f;
    return m_pTable[index];
}
