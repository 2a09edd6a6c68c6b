#include <gtest/gtest.h>

#include <string>
#include <thread>
#include <utility>

#include "scene/TwoShotScene.h"
#include "test_two_support.h"

using namespace two_test;

TEST(TwoPipelines, IdenticalShotsHaveNoGlareAndTakeImageTwo) {
    CHologramsRemove remover;
    CImage image = RandomImage(150, 150, 24, 5, 90, 140), copy = image, unused;
    TraceCapture trace;
    remover.HologramsSeperation(image, copy, unused, 0, 150);
    EXPECT_TRUE(SamePixels(image, copy));
    EXPECT_EQ(remover.m_avDifVal, 128);
    EXPECT_EQ(remover.m_avDelta, 0);
    EXPECT_EQ(remover.m_holoPixels.GetSize(), 0);
    ASSERT_FALSE(TraceCapture::Lines().empty());
    const std::wstring& last = TraceCapture::Lines().back();
    EXPECT_NE(last.find(L"[img1Pixels=      0 - img2Pixels=      0] [m_avDifVal=128 - m_avDelta=   0]"),
              std::wstring::npos)
        << std::string(last.begin(), last.end());
}

TEST(TwoPipelines, PyramidChoiceOfIdenticalShotsIsTheReconstruction) {
    CHologramsRemove remover;
    CImage image = RandomImage(97, 83, 24, 6), copy = image, unused;
    remover.HologramsSeperation2(image, copy, unused, 0, 0);
    CPyramid pyramid(7, copy);
    pyramid.MakeLaplacian();
    pyramid.ReconstructGaussian();
    EXPECT_TRUE(SamePixels(image, pyramid.GetLevel(0)));
}

TEST(TwoPipelines, GrowingWithoutDocumentRowsCopiesImageTwo) {
    CHologramsRemove remover;
    CImage image1 = RandomImage(90, 90, 24, 7), image2 = RandomImage(90, 90, 24, 8), unused;
    const CImage before = image2;
    remover.HologramsSeperation3(image1, image2, unused, 30, 70);  // 70 - 30 <= 40: no seeds
    EXPECT_TRUE(SamePixels(image2, before));
    EXPECT_TRUE(SamePixels(image1, before));
    EXPECT_EQ(remover.m_seedList.GetSize(), 0);
}

TEST(TwoPipelines, MismatchedShotsAreRefused) {
    CHologramsRemove remover;
    CImage a = Solid24(60, 60, 1, 2, 3), b = Solid24(60, 61, 1, 2, 3), grey(60, 60, 8), unused;
    const CImage before = a;
    remover.HologramsSeperation(a, b, unused, 0, 60);
    remover.HologramsSeperation2(a, b, unused, 0, 60);
    remover.HologramsSeperation3(a, b, unused, 0, 60);
    remover.HologramsSeperation(grey, grey, unused, 0, 60);
    EXPECT_TRUE(SamePixels(a, before));
    EXPECT_EQ(b.GetHeight(), 61);
}

// Two objects on two threads at once: results equal those of one thread at a time.
TEST(TwoPipelines, ObjectsOnTwoThreadsAreIndependent) {
    const scene::Scene s = scene::GenerateTwoShotScene({240, 340, 3});
    CImage expected1 = s.shots[0], expected2 = s.shots[1], unused;
    CHologramsRemove reference;
    reference.HologramsSeperation(expected1, expected2, unused, 0, 340);
    CImage a1 = s.shots[0], a2 = s.shots[1], b1 = s.shots[0], b2 = s.shots[1], u1, u2;
    std::thread first([&] { CHologramsRemove r; r.HologramsSeperation(a1, a2, u1, 0, 340); });
    std::thread second([&] { CHologramsRemove r; r.HologramsSeperation(b1, b2, u2, 0, 340); });
    first.join();
    second.join();
    EXPECT_TRUE(SamePixels(a1, expected1));
    EXPECT_TRUE(SamePixels(b1, expected1));
}

TEST(TwoPipelines, EveryPipelineLeavesLessGlareThanEitherShot) {
    const scene::Scene s = scene::GenerateTwoShotScene({480, 680, 2});
    const double shot1 = scene::GlareShare(s, s.shots[0]);
    const double shot2 = scene::GlareShare(s, s.shots[1]);
    ASSERT_GT(shot1, 0.2);
    ASSERT_GT(shot2, 0.2);
    for (int method = 1; method <= 3; ++method) {
        CHologramsRemove remover;
        CImage image1 = s.shots[0], image2 = s.shots[1], unused;
        if (method == 1) remover.HologramsSeperation(image1, image2, unused, 0, 680);
        if (method == 2) remover.HologramsSeperation2(image1, image2, unused, 0, 680);
        if (method == 3) remover.HologramsSeperation3(image1, image2, unused, 0, 680);
        const double share = scene::GlareShare(s, image1);
        std::printf("method %d: glare share %.3f (shots %.3f, %.3f), psnr %.2f\n", method, share, shot1, shot2,
                    scene::Evaluate(s, image1).psnr);
        EXPECT_LT(share, shot1) << method;
        EXPECT_LT(share, shot2) << method;
    }
}

// Shots too small for the windows and borders of the pipelines pass through without harm.
TEST(TwoPipelines, TinyShotsAreHandled) {
    for (const auto& size : {std::pair{1, 1}, std::pair{2, 3}, std::pair{5, 5}, std::pair{17, 9}, std::pair{70, 40}}) {
        for (int method = 1; method <= 3; ++method) {
            CHologramsRemove remover;
            CImage a = RandomImage(size.first, size.second, 24, 40), b = RandomImage(size.first, size.second, 24, 41);
            CImage unused;
            if (method == 1) remover.HologramsSeperation(a, b, unused, 0, size.second);
            if (method == 2) remover.HologramsSeperation2(a, b, unused, 0, size.second);
            if (method == 3) remover.HologramsSeperation3(a, b, unused, -100, 1000);
            EXPECT_EQ(a.GetWidth(), size.first);
            EXPECT_EQ(a.GetHeight(), size.second);
        }
    }
}
