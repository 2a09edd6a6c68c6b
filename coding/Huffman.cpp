#include "coding/Huffman.h"

#include <cstddef>
#include <new>
#include <vector>

#include "imagelib/Trace.h"

namespace {

// A heap slot: the cell's weight beside the index of the cell in the node pool. Moving
// these small slots instead of whole cells keeps the heap compact; the order is the same.
struct HeapSlot {
    int32_t count;
    uint32_t cell;
};

// Binary min-heap of cells ordered by count, kept in an array with the smallest at index 0.
// Its push and pop moves are fixed exactly, because they decide which of two equal counts
// comes out first and so which codes the symbols get.
class CellHeap {
public:
    explicit CellHeap(size_t capacity) { m_slots.reserve(capacity); }
    bool Empty() const { return m_slots.empty(); }

    void Push(HeapSlot slot) {
        m_slots.emplace_back();
        SiftUp(m_slots.size() - 1, slot);
    }

    HeapSlot Pop() {
        const HeapSlot top = m_slots[0];
        const HeapSlot last = m_slots.back();
        const size_t m = m_slots.size() - 1;  // size after the removal
        size_t hole = 0;
        // Walk the hole down along the lighter child; on equal counts the right child moves up.
        while (2 * hole + 2 < m) {
            size_t child = 2 * hole + 2;
            if (m_slots[child].count > m_slots[child - 1].count) --child;
            m_slots[hole] = m_slots[child];
            hole = child;
        }
        if (2 * hole + 2 == m) {
            m_slots[hole] = m_slots[m - 1];
            hole = m - 1;
        }
        SiftUp(hole, last);
        m_slots.pop_back();
        return top;
    }

private:
    // Parents move down only when strictly heavier, so equal counts keep their places.
    void SiftUp(size_t hole, HeapSlot slot) {
        while (hole > 0) {
            const size_t parent = (hole - 1) / 2;
            if (!(m_slots[parent].count > slot.count)) break;
            m_slots[hole] = m_slots[parent];
            hole = parent;
        }
        m_slots[hole] = slot;
    }

    std::vector<HeapSlot> m_slots;
};

}  // namespace

CHuffman::~CHuffman() { delete[] m_pCodes; }

bool CHuffman::CodeBuild(const int* histogram, int symbolCount) {
    if (symbolCount < 0 || (symbolCount > 0 && histogram == nullptr)) {
        Trace(L"CHuffman::CodeBuild: no histogram of %d symbols\n", symbolCount);
        return false;
    }
    try {
        delete[] m_pCodes;
        m_pCodes = nullptr;
        m_nSymbols = 0;
        m_pCodes = new SHuffmanCode[static_cast<size_t>(symbolCount)]();
        m_nSymbols = symbolCount;

        // Every cell lives in one pool that never reallocates (at most 2n - 1 cells), so the
        // children pointers stay valid; the tree is released on return.
        std::vector<CHistCell> cells;
        cells.reserve(2 * static_cast<size_t>(symbolCount));
        CellHeap heap(static_cast<size_t>(symbolCount));
        auto pushCell = [&](const CHistCell& cell) {
            cells.push_back(cell);
            heap.Push(HeapSlot{cell.m_nCount, static_cast<uint32_t>(cells.size() - 1)});
        };
        for (int i = 0; i < symbolCount; ++i) {
            if (histogram[i] < 1) {
                m_pCodes[i].symbol = -1;
            } else {
                pushCell(CHistCell{i, histogram[i], nullptr, nullptr});
                m_pCodes[i].symbol = i;
            }
        }

        CHistCell* root = nullptr;
        while (!heap.Empty()) {
            CHistCell* lighter = &cells[heap.Pop().cell];
            if (heap.Empty()) {
                root = lighter;
                break;
            }
            CHistCell* heavier = &cells[heap.Pop().cell];
            int32_t weight = 0;
            // A total beyond the 32-bit weight cannot be represented in the tree.
            if (__builtin_add_overflow(lighter->m_nCount, heavier->m_nCount, &weight)) throw OutOfRangeT();
            pushCell(CHistCell{0, weight, lighter, heavier});
        }
        if (root != nullptr) TableBuild(root, 1);
    } catch (const OutOfRangeT&) {
        Trace(L"CHuffman: error in building the codes table\n");
        return false;
    } catch (const std::bad_alloc&) {
        Trace(L"CHuffman::CodeBuild: allocation failure\n");
        return false;
    }
    return true;
}

bool CHuffman::CodeSymbols(const int*, unsigned int, unsigned short*, unsigned int) { return true; }

void CHuffman::TableBuild(CHistCell* node, unsigned int code) {
    if (node == nullptr) return;
    constexpr unsigned int kTopBit = 0x80000000u;
    while (node->m_pLeft != nullptr || node->m_pRight != nullptr) {
        // One more level would push the marker bit out of the 32-bit code field.
        if (code & kTopBit) throw OutOfRangeT();
        if (node->m_pLeft != nullptr) TableBuild(node->m_pLeft, 2 * code);
        node = node->m_pRight;
        code = 2 * code + 1;
        if (node == nullptr) return;
    }
    const int32_t symbol = node->m_nSymbol;
    if (symbol < 0 || symbol >= m_nSymbols || m_pCodes[symbol].symbol == -1) throw OutOfRangeT();
    m_pCodes[symbol].code = code;
}
