package com.tav.android.pixara.photoretouching.jni;

import static org.junit.jupiter.api.Assertions.assertTrue;

import java.lang.reflect.InvocationTargetException;
import java.lang.reflect.Method;
import java.lang.reflect.Modifier;
import java.util.Arrays;
import java.util.Comparator;
import java.util.Random;
import org.junit.jupiter.api.Test;

/**
 * Every native method of Engine called with hostile arguments: null, empty and
 * short arrays, sizes that are zero, negative or huge, rectangles outside the
 * picture, extreme levels. The process must survive every call, no Java
 * exception may escape. (Under the sanitizer build, where the JVM's array
 * copies come from the instrumented allocator, a read or write past an array
 * also fails the run.)
 */
class RobustnessTest {
    private static final int[] SIZES = {-7, -1, 0, 1, 2, 3, 8, 17};
    private static final int[] INTS = {Integer.MIN_VALUE, -100000, -255, -1, 0, 1, 2, 5, 10, 20, 50, 99, 100, 255,
        4096, 100000, Integer.MAX_VALUE};

    @Test
    void everyNativeMethodSurvivesHostileArguments() throws Exception {
        Method[] methods = Engine.class.getDeclaredMethods();
        Arrays.sort(methods, Comparator.comparing(Method::getName));
        Random rng = new Random(20261121);
        int calls = 0;
        for (Method m : methods) {
            if (!Modifier.isNative(m.getModifiers())) {
                continue;
            }
            for (int round = 0; round < 40; round++) {
                Object[] args = arguments(m, rng);
                try {
                    m.invoke(null, args);
                } catch (InvocationTargetException e) {
                    throw new AssertionError(m.getName() + Arrays.deepToString(args) + " threw " + e.getCause(), e);
                }
                calls++;
            }
        }
        cleanUp();
        assertTrue(calls > 100, "only " + calls + " calls made");
    }

    /** Leaves no session, saved state or changed setting behind for the other tests. */
    private static void cleanUp() throws Exception {
        call("setAutoAdjust", new Class<?>[] {int.class, int.class, int.class, int.class}, 70, 100, 1000, 5120);
        call("setEraserStatus", new Class<?>[] {int.class}, 53249);
        for (String name : new String[] {"deleteStoredMask", "deleteStoredObject", "finishSplash", "destroyBlur",
            "destroyTiltShift", "finishPortrait", "DeInitBLC"}) {
            try {
                Engine.class.getMethod(name).invoke(null);
            } catch (NoSuchMethodException e) {
                // not built in this library
            }
        }
    }

    private static void call(String name, Class<?>[] types, Object... args) throws Exception {
        try {
            Engine.class.getMethod(name, types).invoke(null, args);
        } catch (NoSuchMethodException e) {
            // not built in this library
        }
    }

    private static Object[] arguments(Method m, Random rng) {
        Class<?>[] types = m.getParameterTypes();
        Object[] args = new Object[types.length];
        int w = SIZES[rng.nextInt(SIZES.length)];
        int h = SIZES[rng.nextInt(SIZES.length)];
        boolean sensible = rng.nextInt(3) == 0;  // a third of the calls get well-formed pictures
        if (sensible) {
            w = 1 + rng.nextInt(24);
            h = 1 + rng.nextInt(24);
        }
        int intsSeen = 0;
        for (int i = 0; i < types.length; i++) {
            Class<?> t = types[i];
            if (t == int[].class) {
                int n = arrayLength(rng, w, h, sensible);
                if (n < 0) {
                    args[i] = null;
                } else {
                    int[] a = new int[n];
                    for (int k = 0; k < n; k++) {
                        a[k] = rng.nextInt();
                    }
                    args[i] = a;
                }
            } else if (t == byte[].class) {
                int n = arrayLength(rng, w, h, sensible);
                if (n < 0) {
                    args[i] = null;
                } else {
                    byte[] a = new byte[n];
                    for (int k = 0; k < n; k++) {
                        a[k] = (byte) rng.nextInt(3);
                    }
                    args[i] = a;
                }
            } else if (t == int.class) {
                // The first two ints of most methods are sizes or coordinates.
                args[i] = sensible && rng.nextBoolean() ? (intsSeen % 2 == 0 ? w : h) : INTS[rng.nextInt(INTS.length)];
                intsSeen++;
            } else if (t == boolean.class) {
                args[i] = rng.nextBoolean();
            } else if (t == float.class) {
                float[] fs = {0f, 0.5f, 1f, 2f, -1f, Float.NaN, Float.POSITIVE_INFINITY, 1e30f};
                args[i] = fs[rng.nextInt(fs.length)];
            } else if (t == double.class) {
                args[i] = rng.nextDouble() * 4 - 1;
            } else if (t == Rect.class) {
                args[i] = rect(rng, w, h);
            } else if (t.isInterface()) {
                // A listener that ignores what it is told.
                args[i] = rng.nextBoolean() ? null
                        : java.lang.reflect.Proxy.newProxyInstance(t.getClassLoader(), new Class<?>[] {t},
                                (proxy, method, a) -> null);
            } else if (t == Object.class) {
                args[i] = rng.nextBoolean() ? null : new Object();
            } else {
                throw new AssertionError("no argument maker for " + t + " in " + m.getName());
            }
        }
        return args;
    }

    /** -1 for null; otherwise a length that is short, exact or generous for a w x h picture. */
    private static int arrayLength(Random rng, int w, int h, boolean sensible) {
        int need = Math.max(0, w) * Math.max(0, h);
        switch (sensible ? 2 + rng.nextInt(3) : rng.nextInt(5)) {
            case 0:
                return -1;
            case 1:
                return rng.nextInt(need + 1);
            case 2:
                return need;
            default:
                return need * 4 + 16;
        }
    }

    private static Rect rect(Random rng, int w, int h) {
        switch (rng.nextInt(6)) {
            case 0:
                return null;
            case 1:
                return new Rect();
            case 2:
                return new Rect(-5, -5, w + 5, h + 5);
            case 3:
                return new Rect(w + 3, h + 3, w + 9, h + 9);
            case 4:
                return new Rect(Integer.MIN_VALUE, 0, Integer.MAX_VALUE, 1);
            default:
                int l = rng.nextInt(Math.max(1, w));
                int t = rng.nextInt(Math.max(1, h));
                return new Rect(l, t, l + rng.nextInt(Math.max(1, w)), t + rng.nextInt(Math.max(1, h)));
        }
    }
}
