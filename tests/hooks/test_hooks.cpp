// Test-only JNI methods of the class TestHooks: the allocation failure hook,
// the block count of the engine's memory wrappers and the scalar switch,
// reached through the engine library already loaded in the process (this
// library links to it, never to a copy of the engine).
#include <jni.h>

#include "effect/kalo/px_mem.h"
#include "effect/kalo/px_parallel.h"

#define TEST_HOOK(ret, name) \
  extern "C" JNIEXPORT ret JNICALL Java_com_tav_android_pixara_photoretouching_jni_TestHooks_##name

TEST_HOOK(void, failNthAllocation)(JNIEnv*, jclass, jint n) { px_mem_fail_nth(n); }
TEST_HOOK(jboolean, failurePending)(JNIEnv*, jclass) { return px_mem_fail_pending() ? JNI_TRUE : JNI_FALSE; }
TEST_HOOK(jlong, liveBlocks)(JNIEnv*, jclass) { return static_cast<jlong>(px_mem_live_blocks()); }
TEST_HOOK(void, setScalarOnly)(JNIEnv*, jclass, jboolean on) { px_set_scalar_only(on == JNI_TRUE); }
TEST_HOOK(jboolean, scalarOnly)(JNIEnv*, jclass) { return px_scalar_only() ? JNI_TRUE : JNI_FALSE; }
