#include "scene/Scene.h"

#include <algorithm>
#include <cmath>
#include <vector>

#include "imagelib/Parallel.h"

namespace scene {
namespace {

constexpr float kPi = 3.14159265f;
constexpr float kTruthLight = 0.88f;  // the even diffuse light of the ground truth
constexpr int kGlareExcess = 40;      // specular or foil light above this much is glare

// splitmix64: small, fast and the same everywhere.
class Random {
public:
    explicit Random(uint64_t seed) : m_state(seed * 0x9E3779B97F4A7C15ull + 0x632BE59BD9B4E019ull) {}
    uint64_t Next() {
        uint64_t z = (m_state += 0x9E3779B97F4A7C15ull);
        z = (z ^ (z >> 30)) * 0xBF58476D1CE4E5B9ull;
        z = (z ^ (z >> 27)) * 0x94D049BB133111EBull;
        return z ^ (z >> 31);
    }
    float Uniform(float lo, float hi) { return lo + (hi - lo) * static_cast<float>(Next() >> 40) / 16777216.0f; }
    int Int(int lo, int hi) { return lo + static_cast<int>(Next() % static_cast<uint64_t>(hi - lo + 1)); }

private:
    uint64_t m_state;
};

// Deterministic per-pixel noise in -1..1.
float HashNoise(uint32_t x, uint32_t y, uint32_t k) {
    uint32_t h = x * 0x8DA6B343u ^ y * 0xD8163841u ^ k * 0xCB1AB31Fu;
    h ^= h >> 13;
    h *= 0x5BD1E995u;
    h ^= h >> 15;
    return static_cast<float>(h & 0xFFFF) / 32767.5f - 1.0f;
}

struct Rgb {
    float r, g, b;
};

Rgb Mix(Rgb a, Rgb b, float t) { return {a.r + (b.r - a.r) * t, a.g + (b.g - a.g) * t, a.b + (b.b - a.b) * t}; }

// Fully saturated colour of hue h (0..1).
Rgb Rainbow(float h) {
    h = h - std::floor(h);
    const float x = h * 6.0f;
    auto ramp = [](float v) { return std::clamp(v, 0.0f, 1.0f); };
    return {ramp(std::fabs(x - 3.0f) - 1.0f), ramp(2.0f - std::fabs(x - 2.0f)), ramp(2.0f - std::fabs(x - 4.0f))};
}

struct Layout {
    int w, h;
    float scale;  // pixels per unit of the 1240-wide reference
    int cardLeft, cardTop, cardRight, cardBottom;
    float guillochePhase[3];
    float rosetteX, rosetteY;
    Rgb base;
    // photo area, card-relative 0..1
    float photoL, photoT, photoR, photoB;
    Rgb skin, backdrop;
    // foil ellipse in pixels
    float foilX, foilY, foilRx, foilRy;
    float foilPhase[4];
    // glare spot centres in pixels and radius
    float spotX[4], spotY[4];
    float spotSigma;
};

Layout MakeLayout(int w, int h, Random& rnd) {
    Layout l{};
    l.w = w;
    l.h = h;
    l.scale = static_cast<float>(std::min(w, h * 1240 / 1754 + 1)) / 1240.0f;
    const int margin = std::max(1, std::min(w, h) * 3 / 100);
    l.cardLeft = margin;
    l.cardTop = margin;
    l.cardRight = w - margin;
    l.cardBottom = h - margin;
    for (float& p : l.guillochePhase) p = rnd.Uniform(0.0f, 1.0f);
    l.rosetteX = rnd.Uniform(0.55f, 0.8f) * w;
    l.rosetteY = rnd.Uniform(0.2f, 0.35f) * h;
    l.base = {rnd.Uniform(0.84f, 0.92f), rnd.Uniform(0.86f, 0.93f), rnd.Uniform(0.80f, 0.90f)};
    l.photoL = 0.07f;
    l.photoT = 0.08f;
    l.photoR = 0.36f;
    l.photoB = 0.36f;
    l.skin = {rnd.Uniform(0.75f, 0.9f), rnd.Uniform(0.55f, 0.68f), rnd.Uniform(0.42f, 0.55f)};
    l.backdrop = {rnd.Uniform(0.55f, 0.7f), rnd.Uniform(0.62f, 0.75f), rnd.Uniform(0.75f, 0.88f)};
    l.foilX = rnd.Uniform(0.68f, 0.76f) * w;
    l.foilY = rnd.Uniform(0.58f, 0.66f) * h;
    l.foilRx = 0.16f * w;
    l.foilRy = 0.07f * h;
    for (float& p : l.foilPhase) p = rnd.Uniform(0.0f, 1.0f);
    const float jx = rnd.Uniform(-0.03f, 0.03f), jy = rnd.Uniform(-0.03f, 0.03f);
    const float cx[4] = {0.5f, 0.5f, 0.28f, 0.72f};
    const float cy[4] = {0.28f, 0.72f, 0.5f, 0.5f};
    for (int k = 0; k < 4; ++k) {
        l.spotX[k] = (cx[k] + jx) * w;
        l.spotY[k] = (cy[k] + jy) * h;
    }
    l.spotSigma = 0.085f * std::min(w, h);
    return l;
}

// Dark text-like strokes: lines of glyphs made of thick segments, in an 8-bit ink coverage
// map (0..255) plus one ink colour per pixel row band.
struct Ink {
    std::vector<uint8_t> cover;
    std::vector<uint8_t> colourIndex;
};

void DrawSegment(Ink& ink, int w, int h, float x0, float y0, float x1, float y1, float width, uint8_t colour) {
    const float half = width * 0.5f;
    const int minX = std::max(0, static_cast<int>(std::floor(std::min(x0, x1) - half - 1)));
    const int maxX = std::min(w - 1, static_cast<int>(std::ceil(std::max(x0, x1) + half + 1)));
    const int minY = std::max(0, static_cast<int>(std::floor(std::min(y0, y1) - half - 1)));
    const int maxY = std::min(h - 1, static_cast<int>(std::ceil(std::max(y0, y1) + half + 1)));
    const float dx = x1 - x0, dy = y1 - y0;
    const float len2 = std::max(dx * dx + dy * dy, 1e-6f);
    for (int y = minY; y <= maxY; ++y) {
        for (int x = minX; x <= maxX; ++x) {
            const float px = x + 0.5f - x0, py = y + 0.5f - y0;
            const float t = std::clamp((px * dx + py * dy) / len2, 0.0f, 1.0f);
            const float ex = px - t * dx, ey = py - t * dy;
            const float dist = std::sqrt(ex * ex + ey * ey);
            const float cover = std::clamp(half + 0.5f - dist, 0.0f, 1.0f);
            const size_t i = static_cast<size_t>(y) * w + x;
            const uint8_t c = static_cast<uint8_t>(cover * 255.0f);
            if (c > ink.cover[i]) {
                ink.cover[i] = c;
                ink.colourIndex[i] = colour;
            }
        }
    }
}

// One line of glyphs in the box [x0, x1) at baseline band [top, top + size).
void DrawTextLine(Ink& ink, const Layout& l, Random& rnd, float x0, float x1, float top, float size, float stroke,
                  uint8_t colour) {
    const float cell = size * 0.62f;
    float x = x0;
    while (x + cell < x1) {
        if (rnd.Int(0, 6) == 0) {  // word gap
            x += cell;
            continue;
        }
        const float gl = x, gr = x + cell * 0.8f, gt = top, gb = top + size, gm = top + size * 0.5f;
        const float px[6] = {gl, gr, gl, gr, gl, gr};
        const float py[6] = {gt, gt, gm, gm, gb, gb};
        const int strokes = rnd.Int(2, 4);
        for (int s = 0; s < strokes; ++s) {
            const int a = rnd.Int(0, 5);
            int b = rnd.Int(0, 5);
            if (b == a) b = (a + 3) % 6;
            DrawSegment(ink, l.w, l.h, px[a], py[a], px[b], py[b], stroke, colour);
        }
        x += cell;
    }
}

Ink MakeInk(const Layout& l, Random& rnd) {
    Ink ink;
    ink.cover.assign(static_cast<size_t>(l.w) * l.h, 0);
    ink.colourIndex.assign(static_cast<size_t>(l.w) * l.h, 0);
    const float cw = static_cast<float>(l.cardRight - l.cardLeft);
    const float ch = static_cast<float>(l.cardBottom - l.cardTop);
    // Beside the photo: name and numbers, several sizes and stroke widths.
    float y = l.cardTop + 0.09f * ch;
    int line = 0;
    while (y < l.cardTop + 0.36f * ch) {
        const float size = (line == 0 ? 34.0f : rnd.Uniform(16.0f, 26.0f)) * l.scale;
        const float stroke = std::max(1.0f, (line == 0 ? 5.0f : rnd.Uniform(1.5f, 3.5f)) * l.scale);
        DrawTextLine(ink, l, rnd, l.cardLeft + 0.41f * cw, l.cardLeft + rnd.Uniform(0.7f, 0.94f) * cw, y, size, stroke,
                     static_cast<uint8_t>(line % 2));
        y += size * 1.7f;
        ++line;
    }
    // Lower block of fine print.
    y = l.cardTop + 0.42f * ch;
    while (y < l.cardTop + 0.93f * ch) {
        const float size = rnd.Uniform(12.0f, 20.0f) * l.scale;
        const float stroke = std::max(1.0f, rnd.Uniform(1.0f, 2.5f) * l.scale);
        DrawTextLine(ink, l, rnd, l.cardLeft + 0.07f * cw, l.cardLeft + rnd.Uniform(0.6f, 0.93f) * cw, y, size, stroke,
                     static_cast<uint8_t>(rnd.Int(0, 1)));
        y += size * 1.9f;
    }
    return ink;
}

// Reflectance of the card at a pixel, without ink.
Rgb Paper(const Layout& l, int x, int y) {
    const float u = static_cast<float>(x - l.cardLeft) / (l.cardRight - l.cardLeft);
    const float v = static_cast<float>(y - l.cardTop) / (l.cardBottom - l.cardTop);
    Rgb c = {l.base.r - 0.05f * u, l.base.g - 0.02f * v, l.base.b + 0.05f * v};
    // Guilloche: two families of wavy lines and a rosette, about 2 pixels thick.
    const float period = 14.0f * l.scale;
    const float fx = x / period, fy = y / period;
    const float wave1 = std::sin(2 * kPi * (fx + 1.6f * std::sin(2 * kPi * (fy / 9.0f + l.guillochePhase[0]))));
    const float wave2 = std::sin(2 * kPi * (fy + 1.3f * std::sin(2 * kPi * (fx / 11.0f + l.guillochePhase[1]))));
    if (wave1 > 0.92f) c = Mix(c, {0.45f, 0.72f, 0.6f}, 0.55f);
    if (wave2 > 0.94f) c = Mix(c, {0.8f, 0.55f, 0.45f}, 0.45f);
    const float rx = x - l.rosetteX, ry = y - l.rosetteY;
    const float r = std::sqrt(rx * rx + ry * ry) / period;
    const float theta = std::atan2(ry, rx);
    if (r < 18.0f && std::sin(2 * kPi * (r + 0.9f * std::sin(9 * theta + 6 * kPi * l.guillochePhase[2]))) > 0.9f)
        c = Mix(c, {0.7f, 0.5f, 0.8f}, 0.6f);
    // Photo: a backdrop, a head and shoulders.
    if (u >= l.photoL && u < l.photoR && v >= l.photoT && v < l.photoB) {
        const float pu = (u - l.photoL) / (l.photoR - l.photoL), pv = (v - l.photoT) / (l.photoB - l.photoT);
        c = Mix(l.backdrop, {l.backdrop.r * 0.7f, l.backdrop.g * 0.7f, l.backdrop.b * 0.8f}, pv);
        const float hx = (pu - 0.5f) / 0.24f, hy = (pv - 0.4f) / 0.3f;
        const float sx = (pu - 0.5f) / 0.48f, sy = (pv - 1.05f) / 0.38f;
        if (sx * sx + sy * sy < 1.0f) c = {0.18f, 0.2f, 0.3f};
        if (hx * hx + hy * hy < 1.0f) {
            const float shade = 1.0f - 0.25f * (hx + 0.3f * hy) * (hx > 0 ? 1.0f : 0.3f);
            c = {l.skin.r * shade, l.skin.g * shade, l.skin.b * shade};
            if (hy < -0.55f) c = {0.22f, 0.15f, 0.1f};  // hair
        }
    }
    return c;
}

// 0..1 weight of the foil patch at a pixel (soft edge).
float FoilWeight(const Layout& l, int x, int y) {
    const float ex = (x - l.foilX) / l.foilRx, ey = (y - l.foilY) / l.foilRy;
    const float d = std::sqrt(ex * ex + ey * ey);
    return std::clamp((1.0f - d) * 8.0f, 0.0f, 1.0f);
}

float LightGradient(int k, float u, float v) {
    switch (k) {
    case LightTop: return 1.05f - 0.35f * v;
    case LightBottom: return 0.70f + 0.35f * v;
    case LightLeft: return 1.05f - 0.35f * u;
    default: return 0.70f + 0.35f * u;
    }
}

// The light the foil throws back for light k: rainbow colours that depend on the light's
// direction, strongest on the side of the patch facing the light.
Rgb FoilShine(const Layout& l, int k, int x, int y) {
    const float ex = (x - l.foilX) / l.foilRx, ey = (y - l.foilY) / l.foilRy;
    const float facing[4] = {-ey, ey, -ex, ex};
    const float strength = std::clamp(0.25f + 1.1f * facing[k], 0.0f, 1.0f) * 0.75f;
    const float dirX[4] = {0.3f, -0.3f, 1.0f, -1.0f}, dirY[4] = {1.0f, -1.0f, 0.3f, -0.3f};
    const float hue = l.foilPhase[k] + 1.8f * (ex * dirX[k] + ey * dirY[k]);
    const float stripes = 0.7f + 0.3f * std::sin(40.0f * (ex + 0.5f * ey) + 2.0f * k);
    const Rgb c = Rainbow(hue);
    const float s = strength * stripes;
    return {c.r * s, c.g * s, c.b * s};
}

uint8_t ToByte(float v) { return static_cast<uint8_t>(std::clamp(v * 255.0f + 0.5f, 0.0f, 255.0f)); }

}  // namespace

Scene GenerateScene(const SceneOptions& options) {
    const int w = std::max(16, options.width), h = std::max(16, options.height);
    Random rnd(options.seed);
    const Layout l = MakeLayout(w, h, rnd);
    const Ink ink = MakeInk(l, rnd);
    const Rgb inkColours[2] = {{0.08f, 0.08f, 0.1f}, {0.1f, 0.14f, 0.38f}};
    const Rgb table = {0.22f, 0.2f, 0.18f};

    Scene s;
    for (CImage& shot : s.shots) shot.Reallocate(w, h, 24);
    s.truth.Reallocate(w, h, 24);
    s.glare.Reallocate(w, h, 8);
    s.document.Reallocate(w, h, 8);

    imagelib::ParallelFor(0, h, [&](int begin, int end) {
        for (int y = begin; y < end; ++y) {
            unsigned char* shotRow[4];
            for (int k = 0; k < 4; ++k) shotRow[k] = s.shots[k].GetPtrXY(0, y);
            unsigned char* truthRow = s.truth.GetPtrXY(0, y);
            unsigned char* glareRow = s.glare.GetPtrXY(0, y);
            unsigned char* docRow = s.document.GetPtrXY(0, y);
            const float v = static_cast<float>(y) / h;
            for (int x = 0; x < w; ++x) {
                const bool onCard = x >= l.cardLeft && x < l.cardRight && y >= l.cardTop && y < l.cardBottom;
                Rgb albedo = table;
                float foil = 0.0f;
                if (onCard) {
                    albedo = Paper(l, x, y);
                    const size_t i = static_cast<size_t>(y) * w + x;
                    albedo = Mix(albedo, inkColours[ink.colourIndex[i]], ink.cover[i] / 255.0f);
                    foil = FoilWeight(l, x, y);
                    albedo = Mix(albedo, {0.78f, 0.8f, 0.83f}, 0.3f * foil);
                }
                docRow[x] = onCard ? 255 : 0;
                truthRow[3 * x + 0] = ToByte(albedo.b * kTruthLight);
                truthRow[3 * x + 1] = ToByte(albedo.g * kTruthLight);
                truthRow[3 * x + 2] = ToByte(albedo.r * kTruthLight);
                const float u = static_cast<float>(x) / w;
                uint8_t glareBits = 0;
                for (int k = 0; k < 4; ++k) {
                    const float light = LightGradient(k, u, v);
                    const float dx = (x - l.spotX[k]) / l.spotSigma, dy = (y - l.spotY[k]) / l.spotSigma;
                    const float spec = onCard ? 1.3f * std::exp(-(dx * dx + dy * dy)) : 0.0f;
                    Rgb extra = {spec, spec * 0.98f, spec * 0.94f};
                    if (foil > 0.0f) {
                        const Rgb shine = FoilShine(l, k, x, y);
                        extra = {extra.r + shine.r * foil, extra.g + shine.g * foil, extra.b + shine.b * foil};
                    }
                    const float noise = 1.5f / 255.0f * HashNoise(x, y, k + 4 * options.seed);
                    shotRow[k][3 * x + 0] = ToByte(albedo.b * light + extra.b + noise);
                    shotRow[k][3 * x + 1] = ToByte(albedo.g * light + extra.g + noise);
                    shotRow[k][3 * x + 2] = ToByte(albedo.r * light + extra.r + noise);
                    if (std::max({extra.r, extra.g, extra.b}) * 255.0f > kGlareExcess) glareBits |= 1u << k;
                }
                glareRow[x] = glareBits;
            }
        }
    }, 8);
    return s;
}

bool IsGlare(const unsigned char* pixel, const unsigned char* truthPixel) {
    const int m = std::max({pixel[0], pixel[1], pixel[2]});
    const int t = std::max({truthPixel[0], truthPixel[1], truthPixel[2]});
    const bool nearWhite = std::min({pixel[0], pixel[1], pixel[2]}) >= 250;
    return m - t >= kGlareExcess || (nearWhite && t < 250);
}

namespace {

// A 24-bit image of the scene's size.
bool FitsScene(const Scene& scene, const CImage& image) {
    return image.GetWidth() == scene.truth.GetWidth() && image.GetHeight() == scene.truth.GetHeight() &&
           image.GetBitCount() == 24;
}

// Row y of the scene's glare bits, document mask and truth, and of the image measured.
struct ScoredRows {
    const unsigned char* g;
    const unsigned char* d;
    const unsigned char* t;
    const unsigned char* p;

    ScoredRows(const Scene& scene, const CImage& image, int y)
        : g(scene.glare.GetPtrXY(0, y)), d(scene.document.GetPtrXY(0, y)), t(scene.truth.GetPtrXY(0, y)),
          p(image.GetPtrXY(0, y)) {}
};

}  // namespace

double GlareShare(const Scene& scene, const CImage& image) {
    if (!FitsScene(scene, image)) return 1.0;
    const int w = scene.truth.GetWidth(), h = scene.truth.GetHeight();
    long glaring = 0, still = 0;
    for (int y = 0; y < h; ++y) {
        const ScoredRows r(scene, image, y);
        for (int x = 0; x < w; ++x) {
            if (!r.g[x] || !r.d[x]) continue;
            ++glaring;
            if (IsGlare(r.p + 3 * x, r.t + 3 * x)) ++still;
        }
    }
    return glaring ? static_cast<double>(still) / glaring : 0.0;
}

Quality Evaluate(const Scene& scene, const CImage& result) {
    Quality q;
    if (!FitsScene(scene, result)) {
        q.glareRemaining = 1.0;
        return q;
    }
    const int w = scene.truth.GetWidth(), h = scene.truth.GetHeight();
    double sumSq = 0.0;
    long samples = 0;
    for (int y = 0; y < h; ++y) {
        const ScoredRows r(scene, result, y);
        for (int x = 0; x < w; ++x) {
            if (!r.d[x]) continue;
            for (int c = 0; c < 3; ++c) {
                const double e = static_cast<double>(r.p[3 * x + c]) - r.t[3 * x + c];
                sumSq += e * e;
            }
            samples += 3;
            if (r.g[x]) ++q.glarePixels;
        }
    }
    const double mse = samples ? sumSq / samples : 0.0;
    q.psnr = mse > 0.0 ? 10.0 * std::log10(255.0 * 255.0 / mse) : 99.0;
    q.glareRemaining = GlareShare(scene, result);
    return q;
}

}  // namespace scene
