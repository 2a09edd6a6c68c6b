#include "holograms/HologramsRemove.h"

CHologramBlob::CHologramBlob()
    : m_gainR(65536),
      m_offsetR(0),
      m_gainG(65536),
      m_offsetG(0),
      m_gainB(65536),
      m_offsetB(0),
      m_pixelCount(0),
      m_rimCount(0),
      m_pixelOffsets(nullptr),
      m_rimOffsets(nullptr) {}

CHologramBlob::~CHologramBlob() {
    delete[] m_pixelOffsets;
    delete[] m_rimOffsets;
}

// The three int members stay unset until an operation writes them; the arrays start empty
// and the pyramids without levels.
CHologramsRemove::CHologramsRemove() : m_lastStep(-1) {}

// The pyramids and arrays release themselves (in reverse member order); only the blobs the
// object owns need deleting, through their virtual destructor.
CHologramsRemove::~CHologramsRemove() {
    for (int i = 0; i < m_holoBlobs.GetSize(); ++i) delete m_holoBlobs[i];
    m_holoBlobs.RemoveAll();
}

void CHologramsRemove::Barrel(CImage&, int, int, float, float, float, float) {}
