package com.tav.android.pixara.photoretouching.jni;

import java.util.Arrays;
import java.util.Random;

/** Pictures the bridge tests share. */
final class TestPictures {
    private TestPictures() {
    }

    /** n seeded random ARGB pixels (random alpha too). */
    static int[] random(int n, long seed) {
        Random r = new Random(seed);
        int[] p = new int[n];
        for (int i = 0; i < p.length; i++) {
            p[i] = r.nextInt();
        }
        return p;
    }

    /** n pixels of one value. */
    static int[] filled(int n, int value) {
        int[] p = new int[n];
        Arrays.fill(p, value);
        return p;
    }
}
