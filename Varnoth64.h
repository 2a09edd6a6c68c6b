#pragma once

// Varnoth64: image processing for a document scanner that photographs one document several
// times. Including this header reaches every exported class and function of the library and
// the image-library types it works on.

#include "imagelib/CImage.h"
#include "imagelib/DumpPath.h"
#include "imagelib/Parallel.h"
#include "imagelib/Round.h"
#include "imagelib/StopWatch.h"
#include "imagelib/Trace.h"
#include "imagelib/Types.h"

#include "frame/Errors.h"
#include "frame/ImageArithmetic.h"
#include "frame/Matrix.h"
#include "frame/SafeArray.h"
#include "frame/VarnothApp.h"

#include "pyramid/Pyramid.h"
#include "pyramid/Fusion.h"

#include "holograms/HologramsRemove.h"

#include "channels/CheatIR.h"

#include "geometry/Geometry.h"

#include "coding/CorresTable.h"
#include "coding/Huffman.h"
