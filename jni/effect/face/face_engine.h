// Face engine: finds faces, eyes and mouths in a photo and keeps them in one
// record that the portrait operations read.
#pragma once

#include <cstdint>

#include "sm_image.h"

// Detection modes: 1 upright only; 2 upright only (its second flag is passed
// down without effect); anything else upright plus the +-45 degree passes.
typedef int caFDMode;
// Bit field; the beautifier runs only when a bit of 0xF0 is set.
typedef int caBeautyPlusMode;

struct caFaceBox {
  int32_t x, y, width, height;
};
struct caEyePair {
  int32_t x1, y1, x2, y2;
};

// One per session, zero-filled when created; the fields in this order.
struct FaceEngineInfo {
  int32_t maxFace;
  int32_t faceCount;
  caFaceBox* faceRect;
  caEyePair* eyePoints;
  int32_t precision;
  int32_t* faceAux;
  int32_t* faceRotated;
  int32_t* eyeValid;
  caFDMode fdMode;
  caBeautyPlusMode beautyMode;
  int32_t beautyLevel;
  int32_t reserved;
  SMyPoint2* mouthCenter;
  caFaceBox* mouthRect;
  caFaceBox* mouthAux;
};

// The grey working image handed to the stage wrappers.
struct caWorkImage {
  int32_t width;
  int32_t height;
  int32_t flag;  // 1
  unsigned char* data;
};

// Banner of the face engine.
extern char caAPP_Title[100];
extern char caAPP_Version[100];
extern char caAPP_Date[100];
extern char caAPP_Group[100];
extern char caAPP_Model[100];
extern char caAPP_Platform[100];
extern char caAPP_Compiler[100];
extern char caAPP_Comment[500];

// 1 on success, 0 when the face or eye arrays cannot be allocated.
int InitFaceBeautyPlus(FaceEngineInfo* info, caFDMode mode, int maxFace, int precision, caBeautyPlusMode beautyMode,
                       int beautyLevel, int reserved);
// Finds faces, eyes and mouths in an ARGB photo; returns 1.
int RunFaceAnalyzer(FaceEngineInfo* info, const int* argb, int width, int height);
// Runs the skin beautifier over the found faces when beautyMode & 0xF0; 0.
int RunFaceBeautyPlus(FaceEngineInfo* info, int* argb, int width, int height);
int RunFaceBeautyPlusSingleFace(FaceEngineInfo* info, int* argb, int width, int height, int faceIndex);
void ReleaseFaceBeautyPlus(FaceEngineInfo* info);

// The skin beautifier that RunFaceBeautyPlus calls, in the argument order of
// Face_BeautifierRGB: the photo, its height and width, the strength
// (beautyLevel) and the face boxes (x, y, width, height) in photo
// coordinates. Installed by the portrait module; with no hook installed the
// photo is left unchanged.
typedef void (*caFaceBeautifier)(int* argb, int height, int width, int level, const caFaceBox* faces, int count);
void caIF_SetBeautifier(caFaceBeautifier hook);

int caIF_InitFD(FaceEngineInfo* info, caFDMode mode, int maxFace, int precision);
int caIF_RunFD(const caWorkImage* work, FaceEngineInfo* info);
void caIF_ReleaseFD(FaceEngineInfo* info);
int caIF_InitED(FaceEngineInfo* info);
int caIF_RunED(const caWorkImage* work, FaceEngineInfo* info, int face);  // 32 found, 2 not
void caIF_ReleaseED(FaceEngineInfo* info);
int caIF_RunMD(const caWorkImage* work, FaceEngineInfo* info, int face);  // 1 found, 0 not

// Roll check on two eye points: 1 when (dx * 1024) / (dx^2 + dy^2) > 950.
int CheckRipRotation(int x1, int y1, int x2, int y2);
// Working size of the analysis: the longer side becomes 640.
void caIF_WorkingSize(int width, int height, int* workWidth, int* workHeight);
