// A program outside the tree: finds the installed package and subtracts two images.
#include <Varnoth64.h>

#include <cstdio>

int main() {
    CImage a(7, 3, 24), b(7, 3, 24), out;
    a.Set(200);
    b.Set(50);
    ImageSubtract(a, b, out);
    const unsigned char* p = out.GetPtrXY(6, 2);
    if (out.GetWidth() != 7 || p[0] != 255) {
        std::printf("unexpected result\n");
        return 1;
    }
    b.Set(150);
    ImageSubtract(a, b, out);
    if (out.GetPtrXY(3, 1)[2] != 178) return 1;
    std::printf("consumer ok\n");
    return 0;
}
