package com.tav.android.pixara.photoretouching.glimmer;

import com.tav.android.pixara.photoretouching.glimmer.Operations.Job;
import com.tav.android.pixara.photoretouching.glimmer.Operations.Operation;
import com.tav.android.pixara.photoretouching.glimmer.Operations.OperationException;
import com.tav.android.pixara.photoretouching.glimmer.Operations.Param;
import com.tav.android.pixara.photoretouching.jni.Engine;

import java.util.List;

/** Face analysis: prints the faces, eyes and mouths found and draws them onto a copy of the photo. */
final class FaceOperations {
    private static final int FACE = 0xFF00E000;
    private static final int EYE = 0xFF00E0FF;
    private static final int MOUTH = 0xFFFF40FF;

    private FaceOperations() {
    }

    static List<Operation> list() {
        return List.of(new Operation("faces", "Find faces, eyes and mouths; print them and draw them on the picture",
                false, List.of(new Param("mode", 1, 3, 1, 1, "1 upright faces, 3 also faces rolled by 45 degrees")),
                FaceOperations::faces));
    }

    private static void faces(Job j) throws OperationException {
        int[] report = new int[20 * Engine.FACE_REPORT_INTS];
        int n = Engine.analyzeFaces(j.in, j.width, j.height, j.value("mode") == 3 ? 3 : 1, report);
        if (n < 0 || n > 20) {
            throw new OperationException("face analysis failed with result code " + n);
        }
        System.arraycopy(j.in, 0, j.out, 0, j.in.length);
        System.out.println(n + (n == 1 ? " face" : " faces"));
        for (int i = 0; i < n; i++) {
            int o = i * Engine.FACE_REPORT_INTS;
            int x = report[o];
            int y = report[o + 1];
            int w = report[o + 2];
            int h = report[o + 3];
            StringBuilder line = new StringBuilder(String.format("face %d: box %d,%d %dx%d", i, x, y, w, h));
            box(j, x, y, w, h, FACE);
            if (report[o + 4] == 1) {
                line.append(String.format(", eyes (%d,%d) (%d,%d)", report[o + 5], report[o + 6], report[o + 7],
                        report[o + 8]));
                cross(j, report[o + 5], report[o + 6], Math.max(3, w / 16), EYE);
                cross(j, report[o + 7], report[o + 8], Math.max(3, w / 16), EYE);
            }
            if (report[o + 9] >= 0) {
                line.append(String.format(", mouth (%d,%d)", report[o + 9], report[o + 10]));
                cross(j, report[o + 9], report[o + 10], Math.max(3, w / 12), MOUTH);
            }
            System.out.println(line);
        }
    }

    private static void plot(Job j, int x, int y, int colour) {
        if (x >= 0 && y >= 0 && x < j.width && y < j.height) {
            j.out[y * j.width + x] = colour;
        }
    }

    private static void box(Job j, int x, int y, int w, int h, int colour) {
        for (int t = 0; t < 2; t++) {
            for (int k = 0; k < w; k++) {
                plot(j, x + k, y + t, colour);
                plot(j, x + k, y + h - 1 - t, colour);
            }
            for (int k = 0; k < h; k++) {
                plot(j, x + t, y + k, colour);
                plot(j, x + w - 1 - t, y + k, colour);
            }
        }
    }

    private static void cross(Job j, int x, int y, int r, int colour) {
        for (int k = -r; k <= r; k++) {
            plot(j, x + k, y, colour);
            plot(j, x, y + k, colour);
        }
    }
}
