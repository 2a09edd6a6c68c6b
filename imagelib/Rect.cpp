#include <algorithm>

#include "imagelib/Types.h"

bool IsRectEmpty(const RECT* r) { return r->right <= r->left || r->bottom <= r->top; }

bool SetRectEmpty(RECT* r) {
    *r = RECT{};
    return true;
}

bool IntersectRect(RECT* dst, const RECT* a, const RECT* b) {
    const RECT overlap{std::max(a->left, b->left), std::max(a->top, b->top), std::min(a->right, b->right),
                       std::min(a->bottom, b->bottom)};
    if (overlap.left >= overlap.right || overlap.top >= overlap.bottom) {
        SetRectEmpty(dst);
        return false;
    }
    *dst = overlap;
    return true;
}

bool UnionRect(RECT* dst, const RECT* a, const RECT* b) {
    const bool aEmpty = IsRectEmpty(a), bEmpty = IsRectEmpty(b);
    if (aEmpty && bEmpty) {
        SetRectEmpty(dst);
        return false;
    }
    if (aEmpty) {
        *dst = *b;
    } else if (bEmpty) {
        *dst = *a;
    } else {
        *dst = RECT{std::min(a->left, b->left), std::min(a->top, b->top), std::max(a->right, b->right),
                    std::max(a->bottom, b->bottom)};
    }
    return true;
}
