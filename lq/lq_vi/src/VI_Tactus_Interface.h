#pragma once
// The outside face of libTactusEngine: the functions a host calls on its camera
// thread. A reference argument is an out-parameter; at the calling level it is a
// pointer to the caller's variable.

#include <string>

#include "LQ_SharedPtr.h"
#include "LQ_ViInterface.h"

#define VI_EXPORT __attribute__((visibility("default")))

extern "C" {
VI_EXPORT void VI_Tactus_Init();
VI_EXPORT void VI_Tactus_SetParameter(const char* name, const char* value);
VI_EXPORT void VI_Tactus_SetRoi(int a, int b, int c, int d);
VI_EXPORT void VI_Tactus_SetFrame(unsigned char* frame, int width, int height, int i);
VI_EXPORT void VI_Tactus_SetFrameParameter(const char* key, const char* value);
VI_EXPORT void VI_Tactus_ProcessFrame();
VI_EXPORT int VI_Tactus_GetGesture(const char*& gesture, int i);
VI_EXPORT int VI_Tactus_GetRect(float& left, float& top, float& right, float& bottom, int i);
VI_EXPORT int VI_Tactus_GetPoint(float& x, float& y, int i);
VI_EXPORT int VI_Tactus_GetPoint3d(float& x, float& y, float& z, int i);
VI_EXPORT int VI_Tactus_GetFloat(float& value, int i);
VI_EXPORT int VI_Tactus_GetParameter(const char* name, const char*& value, int i);
VI_EXPORT int VI_Tactus_GetFrame(unsigned char*& data, int& width, int& height, int i);
VI_EXPORT void VI_Tactus_Reset();
VI_EXPORT void VI_Tactus_Release();
}

VI_EXPORT const char* VI_Tactus_GetVersion();
VI_EXPORT LQ::ViEngineInfo& VI_Tactus_GetEngineInfo_();
VI_EXPORT const void* VI_Tactus_Request_(const char* name, const void* data);
VI_EXPORT int VI_Tactus_GetDebugImage_(const char*& name, unsigned char*& data, const char*& colorMode, int& width,
                                       int& height, int& stripLength, int i);
VI_EXPORT int VI_Tactus_GetFrameColorMode_(const char*& colorMode, int i);

// Made by the engine library: the concrete engine of this build.
LQ::ViInterface* getEngine();

// The one engine of the process, made on first use and destroyed at exit. Inline so
// that its object has a name of its own outside the library.
struct VI_EXPORT ViInterfaceSingleton {
    VI_EXPORT static LQ::SharedPtr<LQ::ViInterface>& get() {
        static LQ::SharedPtr<LQ::ViInterface> viInterface(getEngine());
        return viInterface;
    }
};

// What has been set for the next frame, the copy of the last result, and the
// settings read by VI_Tactus_Init.
extern VI_EXPORT LQ::ViFrameParameters viFrameParameters;
extern VI_EXPORT LQ::ViResult viResult;
extern VI_EXPORT std::string possibleColorModes[LQ::COLOR_MODE_END];
extern VI_EXPORT bool zoomTwice;
extern VI_EXPORT bool swapRedBlue;
