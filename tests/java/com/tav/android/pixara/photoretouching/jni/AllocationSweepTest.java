package com.tav.android.pixara.photoretouching.jni;

import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertTrue;

import java.lang.reflect.Method;
import java.lang.reflect.Modifier;
import java.util.ArrayList;
import java.util.Arrays;
import java.util.Comparator;
import java.util.List;
import java.util.Random;
import org.junit.jupiter.api.AfterEach;
import org.junit.jupiter.api.Test;

/**
 * Every native method of Engine, called with well-formed arguments, with each
 * of its allocations failing in turn: a method with a result code reports
 * ERR_ALLOC or ERR_EFFECT (or SUCCESS where it has a fallback that needs no
 * memory), every method leaves every array it was given as it was (unless it
 * reports SUCCESS), and the blocks it took are freed.
 */
class AllocationSweepTest {
    private static final int W = 23;
    private static final int H = 17;

    @AfterEach
    void cleanUp() {
        TestHooks.failNthAllocation(0);
        StatefulFuzz.endSessions();
    }

    private static Object[] arguments(Method m, Random rng) {
        Class<?>[] types = m.getParameterTypes();
        Object[] args = new Object[types.length];
        int ints = 0;
        for (int i = 0; i < types.length; i++) {
            Class<?> t = types[i];
            if (t == int[].class) {
                int[] a = new int[W * H * 4];
                for (int k = 0; k < a.length; k++) {
                    a[k] = 0xFF000000 | rng.nextInt(0x1000000);
                }
                args[i] = a;
            } else if (t == byte[].class) {
                byte[] a = new byte[W * H * 4];
                Arrays.fill(a, (byte) 1);
                args[i] = a;
            } else if (t == int.class) {
                // Sizes first (width, height, and again for a second picture), then modest levels.
                args[i] = ints < 2 ? (ints == 0 ? W : H) : (ints % 2 == 0 ? 5 : 4);
                ints++;
            } else if (t == boolean.class) {
                args[i] = false;
            } else if (t == float.class) {
                args[i] = 1f;
            } else if (t == Rect.class) {
                args[i] = new Rect(2, 3, W - 4, H - 2);
            } else if (t.isInterface()) {
                args[i] = null;
            } else {
                args[i] = null;
            }
        }
        if (m.getName().equals("selectTap")) {
            args[7] = Engine.SELECT_ADD; // the generic level would be a mode it refuses before allocating
        }
        return args;
    }

    private static List<Object> snapshot(Object[] args) {
        List<Object> copy = new ArrayList<>();
        for (Object a : args) {
            copy.add(a instanceof int[] ? ((int[]) a).clone() : a instanceof byte[] ? ((byte[]) a).clone() : null);
        }
        return copy;
    }

    private static boolean same(List<Object> before, Object[] args) {
        for (int i = 0; i < args.length; i++) {
            Object b = before.get(i);
            if (b instanceof int[] && !Arrays.equals((int[]) b, (int[]) args[i])) {
                return false;
            }
            if (b instanceof byte[] && !Arrays.equals((byte[]) b, (byte[]) args[i])) {
                return false;
            }
        }
        return true;
    }

    @Test
    void everyMethodSurvivesEachOfItsAllocationsFailing() throws Exception {
        Method[] methods = Engine.class.getDeclaredMethods();
        Arrays.sort(methods, Comparator.comparing(Method::getName));
        int allocating = 0;
        int failures = 0;
        for (Method m : methods) {
            if (!Modifier.isNative(m.getModifiers())) {
                continue;
            }
            for (int n = 1; ; n++) {
                Object[] args = arguments(m, new Random(m.getName().hashCode()));
                List<Object> before = snapshot(args);
                long live = TestHooks.liveBlocks();
                TestHooks.failNthAllocation(n);
                Object result = m.invoke(null, args);
                boolean failed = !TestHooks.failurePending();
                TestHooks.failNthAllocation(0);
                if (!failed) {
                    allocating += n > 1 ? 1 : 0;
                    break;
                }
                failures++;
                String what = m.getName() + ", allocation " + n + " failing";
                boolean success = result instanceof Integer && (Integer) result == Engine.SUCCESS;
                if (m.getReturnType() == int.class && !success) {
                    int rc = (Integer) result;
                    assertTrue(rc == Engine.ERR_ALLOC || rc == Engine.ERR_EFFECT, what + " gave " + rc);
                }
                if (!success) {
                    assertTrue(same(before, args), what + ": an array changed");
                }
                StatefulFuzz.endSessions();
                assertEquals(live, TestHooks.liveBlocks(), what + ": blocks not freed");
            }
            StatefulFuzz.endSessions();
        }
        assertTrue(allocating > 30, "only " + allocating + " methods allocate");
        assertTrue(failures > allocating, failures + " failures tried");
    }
}
