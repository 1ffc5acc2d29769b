// The trained model tables, generated as data by tools/face_training/face_train
// (see its README for how they were made and how to make them again).
#include "face_models.h"

#include "eye_model.inc"
#include "frontal_model.inc"
#include "mouth_model.inc"
