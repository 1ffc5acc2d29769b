package com.tav.android.pixara.photoretouching.jni;

/** The engine's allocation failure hook and block count, from the test-only library. */
final class TestHooks {
    static {
        System.loadLibrary("glimmerEngine");
        System.loadLibrary("glimmerTestHooks");
    }

    private TestHooks() {
    }

    /** The n-th allocation from now fails (1: the next); 0 turns the hook off. */
    static native void failNthAllocation(int n);

    /** Whether the hook still waits for its allocation. */
    static native boolean failurePending();

    /** Blocks the engine has handed out and not yet freed. */
    static native long liveBlocks();
}
