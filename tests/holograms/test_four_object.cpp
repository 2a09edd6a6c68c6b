#include <gtest/gtest.h>

#include "holograms/test_four_support.h"

using namespace four_test;

namespace {

struct CountedBlob : CHologramBlob {
    explicit CountedBlob(int* deaths) : m_deaths(deaths) { m_pixelOffsets = new int32_t[3]; }
    ~CountedBlob() override { ++*m_deaths; }
    int* m_deaths;
};

}  // namespace

TEST(HologramsRemoveObject, OwnsItsBlobsAndSkipsNullEntries) {
    { CHologramsRemove fresh; }  // nothing to release
    int deaths = 0;
    {
        CHologramsRemove remover;
        remover.m_holoBlobs.Add(new CountedBlob(&deaths));
        remover.m_holoBlobs.Add(nullptr);
        remover.m_holoBlobs.Add(new CountedBlob(&deaths));
    }
    EXPECT_EQ(deaths, 2);
    const CHologramBlob blob;
    EXPECT_EQ(blob.m_gainR, 65536);
    EXPECT_EQ(blob.m_offsetB, 0);
    EXPECT_EQ(blob.m_pixelOffsets, nullptr);
}

TEST(HologramsRemoveObject, BarrelLeavesTheImageAlone) {
    CHologramsRemove remover;
    CImage img = Solid(5, 4, {1, 2, 3});
    remover.Barrel(img, 1, 2, 0.5f, 0.5f, 0.5f, 0.5f);
    EXPECT_EQ(At(img, 4, 3), (Bgr{1, 2, 3}));
}
