package com.tav.android.pixara.photoretouching.jni;

import static org.junit.jupiter.api.Assertions.assertArrayEquals;
import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertNotEquals;
import static org.junit.jupiter.api.Assertions.assertTrue;

import java.io.DataInputStream;
import java.io.IOException;
import java.io.InputStream;
import java.nio.file.Files;
import java.nio.file.Path;
import java.nio.file.Paths;
import java.util.ArrayList;
import java.util.Arrays;
import java.util.List;
import org.junit.jupiter.api.AfterEach;
import org.junit.jupiter.api.Test;

/** Portrait session, its face report and guards, and red-eye removal through the bridge. */
class PortraitTest {
    static final int W = 24;
    static final int H = 16;

    /** Records every setFaceInfo call. */
    static final class Faces implements FaceInfoListener {
        final List<int[]> calls = new ArrayList<>();
        final List<Integer> counts = new ArrayList<>();

        @Override
        public void setFaceInfo(int faceCount, int[] faces) {
            counts.add(faceCount);
            calls.add(faces);
        }
    }

    static int[] filled(int n, int value) {
        int[] p = new int[n];
        Arrays.fill(p, value);
        return p;
    }

    /** The 256-pixel astronaut of the face tests, tinted towards skin. */
    static int[] astronaut(int[] size) throws IOException {
        Path dir = Paths.get("").toAbsolutePath();
        Path file = null;
        for (Path d = dir; d != null && file == null; d = d.getParent()) {
            Path f = d.resolve("tests/data/astronaut_256.pgm");
            if (Files.exists(f)) {
                file = f;
            }
        }
        assertTrue(file != null, "tests/data/astronaut_256.pgm not found above " + dir);
        try (InputStream in = Files.newInputStream(file); DataInputStream data = new DataInputStream(in)) {
            int[] header = new int[4];
            int field = 0;
            StringBuilder token = new StringBuilder();
            while (field < 4) {
                int c = data.read();
                if (Character.isWhitespace(c)) {
                    if (token.length() > 0) {
                        header[field++] = field == 1 ? 0 : Integer.parseInt(token.toString());
                        token.setLength(0);
                    }
                } else {
                    token.append((char) c);
                }
            }
            size[0] = header[1];
            size[1] = header[2];
            int[] p = new int[size[0] * size[1]];
            for (int i = 0; i < p.length; i++) {
                int v = data.readUnsignedByte();
                p[i] = 0xFF000000 | v << 16 | (v * 3 / 4) << 8 | (v * 13 / 20);
            }
            return p;
        }
    }

    @AfterEach
    void close() {
        Engine.finishPortrait();
        Engine.setFacebeauty(2, 3, 3);
    }

    @Test
    void withoutSessionEveryPortraitMethodRefuses() {
        Engine.finishPortrait();
        assertEquals(0, Engine.getportraitstatus());
        int[] in = filled(W * H, 0xFF808080);
        int[] out = filled(W * H, 7);
        int[] prev = filled(W * H / 4, 7);
        assertEquals(Engine.ERR_NULL, Engine.runBeautyInPortrait(in, out, W, H, 3));
        assertEquals(Engine.ERR_NULL, Engine.runBeautyInPortraitSingleFace(in, out, W, H, 3, 0));
        assertEquals(Engine.ERR_NULL, Engine.runBeautyInPortraitPreview(in, W, H, prev, W / 2, H / 2, 3));
        assertEquals(Engine.ERR_NULL, Engine.runBeautyInPortraitSingleFacePreview(in, W, H, prev, W / 2, H / 2, 3, 0));
        assertEquals(Engine.ERR_NULL, Engine.runLightenInPortrait(in, out, W, H, 15));
        assertEquals(Engine.ERR_NULL, Engine.runLightenInPortraitSingleFace(in, out, W, H, 15, 0));
        assertEquals(Engine.ERR_NULL, Engine.runLightenInPortraitPreview(in, W, H, prev, W / 2, H / 2, 15));
        assertEquals(Engine.ERR_NULL, Engine.runLightenInPortraitSingleFacePreview(in, W, H, prev, W / 2, H / 2, 15, 0));
        assertEquals(Engine.ERR_NULL, Engine.runOutfocusInPortrait(in, out, W, H, 3));
        assertEquals(Engine.ERR_NULL, Engine.runOutfocusInPortraitPreview(in, W, H, prev, W / 2, H / 2, 3));
        assertArrayEquals(filled(W * H, 7), out);
        assertArrayEquals(filled(W * H / 4, 7), prev);
    }

    @Test
    void settingsKeepTheirRanges() {
        Engine.setFacebeauty(0, 6, 5);
        assertEquals(10, Engine.get_maxFaceCnt());
        assertEquals(3, Engine.getBeautyLevel());
        assertEquals(3, Engine.getDetectOption());
        Engine.setFacebeauty(4, 5, 1);
        assertEquals(4, Engine.get_maxFaceCnt());
        assertEquals(5, Engine.getBeautyLevel());
        assertEquals(1, Engine.getDetectOption());
    }

    @Test
    void sessionLifeCycleAndTheFaceReport() throws IOException {
        int[] size = new int[2];
        int[] photo = astronaut(size);
        int w = size[0];
        int h = size[1];
        Faces faces = new Faces();
        assertEquals(Engine.SUCCESS, Engine.initPortrait(photo, w, h, 5, 4, 1, faces));
        assertEquals(Engine.PORTRAIT_OPEN, Engine.getportraitstatus());
        assertEquals(5, Engine.get_maxFaceCnt());
        assertEquals(4, Engine.getBeautyLevel());
        assertEquals(1, Engine.getDetectOption());
        assertEquals(List.of(1), faces.counts);
        int[] f = faces.calls.get(0);
        assertEquals(9, f.length);
        assertEquals(1, f[0]);  // analysed: eye flag set
        int x = f[1], y = f[2], fw = f[3], fh = f[4];
        assertTrue(x >= 0 && y >= 0 && fw > 30 && fh > 30 && x + fw <= w && y + fh <= h, Arrays.toString(f));
        // Eyes inside the face box, or the mapped "not found" marker on all four.
        boolean found = f[5] >= x && f[5] < x + fw && f[6] >= y && f[6] < y + fh;
        boolean none = f[5] < 0 && f[6] < 0 && f[7] < 0 && f[8] < 0;
        assertTrue(found || none, Arrays.toString(f));

        int[] out = new int[w * h];
        assertEquals(Engine.SUCCESS, Engine.runBeautyInPortrait(photo, out, w, h, 5));
        assertNotEquals(Arrays.hashCode(photo), Arrays.hashCode(out));
        for (int i = 0; i < out.length; i++) {
            assertEquals(0xFF, out[i] >>> 24);
        }
        assertEquals(Engine.SUCCESS, Engine.runLightenInPortrait(photo, out, w, h, 10));
        assertArrayEquals(photo, out);  // level 10: exact copy
        int[] one = filled(w * h, 3);
        assertEquals(Engine.SUCCESS, Engine.runBeautyInPortraitSingleFace(photo, one, w, h, 5, 1));
        assertArrayEquals(filled(w * h, 3), one);  // no face 1: untouched
        int[] prev = filled(w / 2 * (h / 2), 3);
        assertEquals(Engine.SUCCESS, Engine.runOutfocusInPortraitPreview(photo, w, h, prev, w / 2, h / 2, 2));
        assertNotEquals(3, prev[0]);
        assertEquals(Engine.ERR_EFFECT, Engine.runOutfocusInPortraitPreview(photo, w, h, prev, w / 2, h / 2, -1));

        // A second open replaces the first and reports again; a null listener skips the report.
        assertEquals(Engine.SUCCESS, Engine.initPortrait(photo, w, h, 5, 4, 1, faces));
        assertEquals(2, faces.calls.size());
        assertEquals(Engine.SUCCESS, Engine.initPortrait(photo, w, h, 5, 4, 1, null));
        assertEquals(2, faces.calls.size());
        Engine.finishPortrait();
        assertEquals(0, Engine.getportraitstatus());
        assertEquals(Engine.ERR_NULL, Engine.runBeautyInPortrait(photo, out, w, h, 5));
    }

    @Test
    void facelessPhotoReportsNoFaceAndLeavesPicturesAlone() {
        Faces faces = new Faces();
        int[] in = filled(W * H, 0x80646464);
        assertEquals(Engine.SUCCESS, Engine.initPortrait(in, W, H, 2, 3, 1, faces));
        assertEquals(List.of(0), faces.counts);
        assertEquals(0, faces.calls.get(0).length);
        int[] out = filled(W * H, 7);
        assertEquals(Engine.SUCCESS, Engine.runBeautyInPortrait(in, out, W, H, 3));
        assertArrayEquals(filled(W * H, 7), out);
        assertEquals(Engine.ERR_NULL, Engine.runBeautyInPortrait(in, out, W, H, 6));
        assertEquals(Engine.SUCCESS, Engine.runLightenInPortrait(in, out, W, H, 20));
        assertArrayEquals(in, out);  // no face: the plain copy
        // One-shot beautifier without faces: brightening curve, 100 -> 138, alpha kept.
        assertEquals(Engine.SUCCESS, Engine.runFacebeauty(in, out, W, H));
        assertArrayEquals(filled(W * H, 0x808A8A8A), out);
    }

    @Test
    void refusedArraysChangeNothing() {
        int[] in = filled(W * H, 0xFF808080);
        assertEquals(Engine.SUCCESS, Engine.initPortrait(in, W, H, 2, 3, 1, null));
        int[] out = filled(W * H, 7);
        int[] shortPreview = filled(W / 2 * (H / 2) - 1, 7);
        assertEquals(Engine.ERR_NULL, Engine.runBeautyInPortraitPreview(in, W, H, shortPreview, W / 2, H / 2, 0));
        assertEquals(Engine.ERR_NULL, Engine.runLightenInPortraitPreview(in, W, H, shortPreview, W / 2, H / 2, 15));
        assertEquals(Engine.ERR_NULL, Engine.runOutfocusInPortraitPreview(in, W, H, shortPreview, W / 2, H / 2, 3));
        assertEquals(Engine.ERR_NULL, Engine.runBeautyInPortraitPreview(in, W, H, null, W / 2, H / 2, 0));
        assertEquals(Engine.ERR_NULL, Engine.runBeautyInPortraitPreview(in, W, H, out, 0, H / 2, 0));
        assertArrayEquals(filled(W / 2 * (H / 2) - 1, 7), shortPreview);
        assertEquals(Engine.ERR_NULL, Engine.runLightenInPortrait(null, out, W, H, 15));
        assertEquals(Engine.ERR_NULL, Engine.runOutfocusInPortrait(in, new int[W * H - 1], W, H, 3));
        assertEquals(Engine.ERR_NULL, Engine.runFacebeauty(in, out, W, H + 1));
        assertEquals(Engine.ERR_NULL, Engine.initPortrait(new int[3], W, H, 2, 3, 1, null));
        assertEquals(Engine.PORTRAIT_OPEN, Engine.getportraitstatus());  // the open session stays
        assertArrayEquals(filled(W * H, 7), out);
    }

    @Test
    void redEyeThroughTheBridge() {
        int[] p = filled(W * H, 0x40646464);
        for (int y = 6; y < 9; y++) {
            for (int x = 10; x < 13; x++) {
                p[y * W + x] = 0x80FF0000;
            }
        }
        int[] quick = p.clone();
        Engine.removeRedeyePreview(p, quick, W, H, 11, 7, 4);
        assertEquals(0x800C0000, quick[7 * W + 11]);
        assertEquals(0x40646464, quick[7 * W + 9]);
        int[] before = p.clone();
        Engine.removeRedeye(new int[W * H - 1], W, H, 11, 7, 4);  // refused
        Engine.removeRedeyeAuto(p, quick, W, H);
        assertArrayEquals(before, p);
        Engine.removeRedeye(p, W, H, 11, 7, 4);
        assertEquals(0x800C0000, p[7 * W + 11]);
        assertEquals(0x405E6464, p[7 * W + 9]);  // the rim: 94, 100, 100
        assertEquals(0x40646464, p[7 * W + 8]);
    }
}
