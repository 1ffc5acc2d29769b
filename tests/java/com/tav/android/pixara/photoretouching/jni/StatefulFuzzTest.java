package com.tav.android.pixara.photoretouching.jni;

import static org.junit.jupiter.api.Assertions.assertTrue;

import org.junit.jupiter.api.Test;

/** A short run of the stateful fuzz from a fixed seed (the long runs are `./run fuzz` and the sanitizer build's). */
class StatefulFuzzTest {
    @Test
    void fixedSeedSequencesPassEveryCheck() throws InterruptedException {
        long calls = StatefulFuzz.run(20261124L, 4);
        assertTrue(calls > 100, "only " + calls + " calls");
    }
}
