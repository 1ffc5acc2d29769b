package com.tav.android.pixara.photoretouching.glimmer;

import com.tav.android.pixara.photoretouching.jni.Engine;
import com.tav.android.pixara.photoretouching.jni.Rect;

import java.util.ArrayList;
import java.util.Collections;
import java.util.LinkedHashMap;
import java.util.List;
import java.util.Map;

/**
 * Every operation the command line offers, described once: its name, help,
 * parameters with their ranges, and how it calls {@link Engine}. The table
 * drives parsing, range checks, {@code glimmer list} and the demo; a new
 * operation is one more row.
 */
public final class Operations {
    private Operations() {
    }

    /** An integer parameter: accepted range, the engine's neutral value, the value the demo shows. */
    public record Param(String name, int min, int max, int neutral, int demo, String help) {
    }

    /** One run of an operation on a picture. */
    public static final class Job {
        public final int[] in;
        public final int[] out;
        public final int width;
        public final int height;
        /** Selection: the mask (1 = selected) and its rectangle; an empty rectangle means the whole picture. */
        public final byte[] mask;
        public final Rect rect;
        private final Map<String, Integer> values;

        Job(int[] in, int width, int height, byte[] mask, Rect rect, Map<String, Integer> values) {
            this.in = in;
            this.out = new int[in.length];
            this.width = width;
            this.height = height;
            this.mask = mask;
            this.rect = rect;
            this.values = values;
        }

        private int[] result;
        private int resultWidth;
        private int resultHeight;

        /** Tap positions x1, y1, x2, y2, ... given as points= (the selection operations), or null. */
        public int[] points;
        /** A preview picture of the input's size that the command line writes beside the result, or null. */
        public int[] preview;

        /**
         * Sets the picture the operation produced when its size differs from
         * the input's (a turn, crop or mirror); {@code pixels} holds at least
         * width * height values.
         */
        public void replaceResult(int[] pixels, int width, int height) {
            if (width <= 0 || height <= 0 || pixels.length < width * height) {
                throw new IllegalArgumentException("result " + width + "x" + height + " does not fit "
                        + pixels.length + " pixels");
            }
            this.result = pixels;
            this.resultWidth = width;
            this.resultHeight = height;
        }

        /** The picture the operation produced: {@link #out}, unless an action replaced it. */
        public int[] result() {
            return result == null ? out : result;
        }

        public int resultWidth() {
            return result == null ? width : resultWidth;
        }

        public int resultHeight() {
            return result == null ? height : resultHeight;
        }

        public int value(String name) {
            Integer v = values.get(name);
            if (v == null) {
                throw new IllegalStateException("no value for " + name);
            }
            return v;
        }
    }

    /** What an operation does with a job; a failure is reported as an exception with one clear line. */
    @FunctionalInterface
    public interface Action {
        void apply(Job job) throws OperationException;
    }

    public static final class OperationException extends Exception {
        private static final long serialVersionUID = 1L;

        public OperationException(String message) {
            super(message);
        }
    }

    /**
     * An operation. {@code demoRegion} is the selection the demo uses for a regional operation, as
     * fractions {left, top, right, bottom} of the picture (null: the centre two thirds).
     */
    public record Operation(String name, String help, boolean regional, List<Param> params, Action action,
            double[] demoRegion) {
        public Operation(String name, String help, boolean regional, List<Param> params, Action action) {
            this(name, help, regional, params, action, null);
        }

        /** The same operation shown in the demo on another selection. */
        public Operation withDemoRegion(double left, double top, double right, double bottom) {
            return new Operation(name, help, regional, params, action, new double[] {left, top, right, bottom});
        }

        public Param param(String name) {
            for (Param p : params) {
                if (p.name().equals(name)) {
                    return p;
                }
            }
            return null;
        }

        /** Values for a run: each parameter's neutral value, or its demo value. */
        public Map<String, Integer> defaults(boolean demo) {
            Map<String, Integer> m = new LinkedHashMap<>();
            for (Param p : params) {
                m.put(p.name(), demo ? p.demo() : p.neutral());
            }
            return m;
        }
    }

    /** Engine region method with one level. */
    @FunctionalInterface
    interface RegionMethod {
        void call(int[] in, byte[] mask, int[] out, int width, int height, int level, Rect rect);
    }

    /** Engine method returning a status code. */
    @FunctionalInterface
    interface StatusAction {
        int call(Job job);
    }

    static Operation region(String name, String help, Param level, RegionMethod m) {
        return new Operation(name, help, true, List.of(level),
                j -> m.call(j.in, j.mask, j.out, j.width, j.height, j.value(level.name()), j.rect));
    }

    static Operation status(String name, String help, boolean regional, List<Param> params, StatusAction a) {
        return new Operation(name, help, regional, params, j -> {
            int rc = a.call(j);
            if (rc != Engine.SUCCESS) {
                throw new OperationException(name + " failed with result code " + rc);
            }
        });
    }

    static Param level(int min, int max, int neutral, int demo, String help) {
        return new Param("level", min, max, neutral, demo, help);
    }

    private static final List<Operation> ALL;

    static {
        List<Operation> ops = new ArrayList<>();
        // One line an area; each area's class lists its own operations.
        ops.addAll(ToneOperations.list());
        // colour tools
        ops.addAll(ColourOperations.list());

        // effects
        ops.addAll(EffectOperations.list());

        // filters
        ops.addAll(FilterOperations.list());

        // geometry
        ops.addAll(GeometryOperations.list());

        // blur
        ops.addAll(BlurOperations.list());

        // object tools
        ops.addAll(ObjectOperations.list());

        // faces
        ops.addAll(FaceOperations.list());

        // portrait
        ops.addAll(PortraitOperations.list());

        // backlight
        ops.addAll(BacklightOperations.list());

        // selection tools
        ops.addAll(SelectionOperations.list());

        ALL = Collections.unmodifiableList(ops);
    }

    public static List<Operation> all() {
        return ALL;
    }

    public static Operation find(String name) {
        for (Operation op : ALL) {
            if (op.name().equals(name)) {
                return op;
            }
        }
        return null;
    }
}
