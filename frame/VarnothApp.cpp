#include "frame/VarnothApp.h"

#include <atomic>

namespace {
std::atomic<bool> g_registered{false};
}

CVarnothApp::CVarnothApp() { g_registered = true; }
CVarnothApp::~CVarnothApp() { g_registered = false; }
bool CVarnothApp::IsRegistered() { return g_registered; }

// The single module object, alive while the library is loaded.
static CVarnothApp theApp;
