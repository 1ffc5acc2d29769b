// One-call face analysis for callers that only want the results: faces, eye
// centres and mouth centres in photo coordinates.
#pragma once

// Ints a face takes in the report: box x, y, width, height; eyes found (1/0);
// first eye x, y; second eye x, y; mouth centre x, y (-1 when not found).
constexpr int PX_FACE_REPORT_INTS = 11;

// Analyses an ARGB photo (mode as caFDMode: 1 upright, 3 also +-45 degrees)
// and writes at most maxFace faces to `report`. Returns the number of faces,
// or -1 when the face engine's memory cannot be had.
int px_analyze_faces(const int* argb, int width, int height, int mode, int maxFace, int* report);
