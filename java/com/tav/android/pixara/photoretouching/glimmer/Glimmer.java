package com.tav.android.pixara.photoretouching.glimmer;

import com.tav.android.pixara.photoretouching.glimmer.Operations.Job;
import com.tav.android.pixara.photoretouching.glimmer.Operations.Operation;
import com.tav.android.pixara.photoretouching.glimmer.Operations.OperationException;
import com.tav.android.pixara.photoretouching.glimmer.Operations.Param;
import com.tav.android.pixara.photoretouching.jni.Engine;
import com.tav.android.pixara.photoretouching.jni.Rect;

import java.io.File;
import java.io.IOException;
import java.io.PrintStream;
import java.util.Map;

/**
 * The glimmer command line: applies one engine operation to a PNG or JPEG.
 *
 * <pre>
 * glimmer list
 * glimmer &lt;operation&gt; [name=value ...] [rect=left,top,right,bottom] in.jpg out.png
 * glimmer demo [samples-dir] [out-dir]
 * </pre>
 *
 * Bad input is explained in one line on stderr with exit status 2.
 */
public final class Glimmer {
    static final int USAGE = 2;

    private Glimmer() {
    }

    /** A problem with the user's input: one line, exit status 2. */
    static final class UsageException extends Exception {
        private static final long serialVersionUID = 1L;

        UsageException(String message) {
            super(message);
        }
    }

    public static void main(String[] args) {
        System.setProperty("java.awt.headless", "true");
        try {
            run(args, System.out);
        } catch (UsageException | OperationException e) {
            System.err.println("glimmer: " + e.getMessage());
            System.exit(USAGE);
        } catch (IOException e) {
            System.err.println("glimmer: " + e.getMessage());
            System.exit(1);
        }
    }

    static void run(String[] args, PrintStream out) throws UsageException, OperationException, IOException {
        if (args.length == 0 || args[0].equals("help") || args[0].equals("--help")) {
            usage(out);
            return;
        }
        switch (args[0]) {
            case "list" -> list(out);
            case "version" -> out.println(Engine.LibVersion());
            case "demo" -> Demo.run(args.length > 1 ? new File(args[1]) : new File("build/samples"),
                    args.length > 2 ? new File(args[2]) : new File("out"), out);
            default -> apply(args, out);
        }
    }

    static void usage(PrintStream out) {
        out.println("usage: glimmer <operation> [name=value ...] [rect=left,top,right,bottom] [mask=mask.png] in.(png|jpg) out.png");
        out.println("       glimmer list            operations and their parameters");
        out.println("       glimmer demo [samples] [out]   every operation on the sample photos, and a contact sheet");
        out.println("       glimmer version");
    }

    static void list(PrintStream out) {
        for (Operation op : Operations.all()) {
            out.printf("%-16s %s%s%n", op.name(), op.help(), op.regional() ? " [rect=l,t,r,b]" : "");
            for (Param p : op.params()) {
                out.printf("    %s=%d..%d (default %d)  %s%n", p.name(), p.min(), p.max(), p.neutral(), p.help());
            }
        }
    }

    private static void apply(String[] args, PrintStream out) throws UsageException, OperationException, IOException {
        Operation op = Operations.find(args[0]);
        if (op == null) {
            throw new UsageException("unknown operation '" + args[0] + "' (glimmer list shows them)");
        }
        if (args.length < 3) {
            throw new UsageException("usage: glimmer " + op.name() + " [name=value ...] in out.png");
        }
        Map<String, Integer> values = op.defaults(false);
        int[] rect = null;
        File maskFile = null;
        int[] points = null;
        for (int i = 1; i < args.length - 2; i++) {
            String a = args[i];
            int eq = a.indexOf('=');
            if (eq <= 0) {
                throw new UsageException("expected name=value, got '" + a + "'");
            }
            String name = a.substring(0, eq);
            String value = a.substring(eq + 1);
            if (name.equals("rect") && op.regional()) {
                rect = parseRect(value);
                continue;
            }
            if (name.equals("mask") && op.regional()) {
                maskFile = new File(value);
                continue;
            }
            if (name.equals("points") && SelectionOperations.takesPoints(op)) {
                points = SelectionOperations.parsePoints(value);
                continue;
            }
            Param p = op.param(name);
            if (p == null) {
                throw new UsageException(op.name() + " has no parameter '" + name + "'");
            }
            values.put(name, parseValue(p, value));
        }
        File in = new File(args[args.length - 2]);
        File outFile = new File(args[args.length - 1]);
        Picture pic = Picture.read(in);
        Job job = maskFile == null ? pic.job(values, rect) : maskJob(pic, values, rect, maskFile);
        job.points = points;
        op.action().apply(job);
        Picture.write(job.result(), job.resultWidth(), job.resultHeight(), outFile);
        out.println("wrote " + outFile);
        if (job.preview != null) {
            File previewFile = new File(outFile.getPath().replaceFirst("(\\.png)?$", "-overlay.png"));
            Picture.write(job.preview, job.width, job.height, previewFile);
            out.println("wrote " + previewFile);
        }
    }

    static int parseValue(Param p, String value) throws UsageException {
        int v;
        try {
            v = Integer.parseInt(value);
        } catch (NumberFormatException e) {
            throw new UsageException(p.name() + " must be a whole number, got '" + value + "'");
        }
        if (v < p.min() || v > p.max()) {
            throw new UsageException(p.name() + "=" + v + " is outside " + p.min() + ".." + p.max());
        }
        return v;
    }

    static int[] parseRect(String value) throws UsageException {
        String[] parts = value.split(",");
        if (parts.length != 4) {
            throw new UsageException("rect must be left,top,right,bottom, got '" + value + "'");
        }
        int[] r = new int[4];
        for (int i = 0; i < 4; i++) {
            try {
                r[i] = Integer.parseInt(parts[i].trim());
            } catch (NumberFormatException e) {
                throw new UsageException("rect must hold four whole numbers, got '" + value + "'");
            }
        }
        if (r[2] < r[0] || r[3] < r[1]) {
            throw new UsageException("rect " + value + " is empty (right < left or bottom < top)");
        }
        return r;
    }

    /**
     * A job whose selection is a mask picture of the same size: pixels
     * brighter than mid-grey and not transparent are selected, within the
     * rectangle when one is given.
     */
    static Job maskJob(Picture pic, Map<String, Integer> values, int[] rect, File maskFile) throws UsageException {
        Picture m = Picture.read(maskFile);
        if (m.width != pic.width || m.height != pic.height) {
            throw new UsageException("mask " + maskFile + " is " + m.width + "x" + m.height + ", the picture "
                    + pic.width + "x" + pic.height);
        }
        byte[] mask = new byte[pic.width * pic.height];
        for (int i = 0; i < mask.length; i++) {
            int p = m.pixels[i];
            int y = (((p >> 16) & 255) * 299 + ((p >> 8) & 255) * 587 + (p & 255) * 114) / 1000;
            mask[i] = (p >>> 24) != 0 && y > 127 ? (byte) 1 : 0;
        }
        Rect r = rect == null ? Rect.whole() : new Rect(rect[0], rect[1], rect[2], rect[3]);
        return new Job(pic.pixels.clone(), pic.width, pic.height, mask, r, values);
    }

    /** The selection for a rectangle: an ellipse inscribed in it. */
    static byte[] ellipseMask(int width, int height, Rect r) {
        byte[] mask = new byte[width * height];
        double cx = (r.left + r.right) / 2.0;
        double cy = (r.top + r.bottom) / 2.0;
        double rx = Math.max(0.5, (r.right - r.left + 1) / 2.0);
        double ry = Math.max(0.5, (r.bottom - r.top + 1) / 2.0);
        for (int y = Math.max(0, r.top); y <= Math.min(height - 1, r.bottom); y++) {
            for (int x = Math.max(0, r.left); x <= Math.min(width - 1, r.right); x++) {
                double dx = (x - cx) / rx;
                double dy = (y - cy) / ry;
                if (dx * dx + dy * dy <= 1.0) {
                    mask[y * width + x] = 1;
                }
            }
        }
        return mask;
    }
}
