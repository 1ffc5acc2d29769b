package com.tav.android.pixara.photoretouching.jni;

/** The engine's allocation failure hook, block count and scalar switch, from the test-only library. */
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

    /** Forces the plain single-threaded path (true) or lets the fast paths run. */
    static native void setScalarOnly(boolean on);

    /** Whether the plain path is forced. */
    static native boolean scalarOnly();
}
