# ndk-build description of libglimmerEngine (armeabi-v7a with NEON).
LOCAL_PATH := $(call my-dir)
include $(CLEAR_VARS)
LOCAL_MODULE := glimmerEngine
LOCAL_SRC_FILES := $(patsubst $(LOCAL_PATH)/%,%,$(wildcard $(LOCAL_PATH)/*.cpp) \
                   $(shell find $(LOCAL_PATH)/effect -name '*.cpp'))
LOCAL_C_INCLUDES := $(LOCAL_PATH)
LOCAL_CPPFLAGS := -std=c++20 -fno-exceptions -fno-rtti -Wall -Wextra -Werror -ffp-contract=off -fno-math-errno -fwrapv -fconstexpr-steps=100000000
LOCAL_ARM_NEON := true
LOCAL_LDLIBS := -llog -lm
include $(BUILD_SHARED_LIBRARY)
