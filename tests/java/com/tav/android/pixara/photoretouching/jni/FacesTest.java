package com.tav.android.pixara.photoretouching.jni;

import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertTrue;

import java.io.IOException;
import java.nio.file.Files;
import java.nio.file.Path;
import java.util.Arrays;
import org.junit.jupiter.api.Test;

/** The face analysis through the bridge. */
class FacesTest {
    /** A binary PGM of tests/data as opaque grey ARGB pixels; {width, height} in size. */
    static int[] greyPicture(String name, int[] size) throws IOException {
        byte[] b = Files.readAllBytes(Path.of(System.getProperty("glimmer.testdata", "tests/data"), name));
        String[] head = new String(b, 0, 20, java.nio.charset.StandardCharsets.US_ASCII).split("\\s+");
        size[0] = Integer.parseInt(head[1]);
        size[1] = Integer.parseInt(head[2]);
        int offset = b.length - size[0] * size[1];
        int[] p = new int[size[0] * size[1]];
        for (int i = 0; i < p.length; i++) {
            int g = b[offset + i] & 255;
            p[i] = 0xFF000000 | g << 16 | g << 8 | g;
        }
        return p;
    }

    @Test
    void findsTheAstronautWithEyesAndMouth() throws IOException {
        int[] size = new int[2];
        int[] pic = greyPicture("astronaut_256.pgm", size);
        int[] report = new int[5 * Engine.FACE_REPORT_INTS];
        Arrays.fill(report, -7);
        assertEquals(1, Engine.analyzeFaces(pic, size[0], size[1], 1, report));
        int cx = report[0] + report[2] / 2;
        int cy = report[1] + report[3] / 2;
        assertTrue(cx > 100 && cx < 125 && cy > 45 && cy < 75, "face centre " + cx + "," + cy);
        assertEquals(1, report[4]);
        // Both eyes and the mouth lie inside the face box, eyes above the mouth.
        for (int k = 5; k <= 9; k += 2) {
            assertTrue(report[k] >= report[0] && report[k] < report[0] + report[2], "x of point " + k);
            assertTrue(report[k + 1] >= report[1] && report[k + 1] < report[1] + report[3], "y of point " + k);
        }
        assertTrue(report[10] > report[6] && report[10] > report[8]);
        assertEquals(-7, report[Engine.FACE_REPORT_INTS]);  // one face: the rest untouched
    }

    @Test
    void reportSizeBoundsTheFacesAndBadArgumentsAreRefused() throws IOException {
        int[] size = new int[2];
        int[] pic = greyPicture("astronaut_256.pgm", size);
        int[] small = new int[Engine.FACE_REPORT_INTS - 1];
        assertEquals(0, Engine.analyzeFaces(pic, size[0], size[1], 1, small));
        assertEquals(Engine.ERR_NULL, Engine.analyzeFaces(null, size[0], size[1], 1, new int[11]));
        assertEquals(Engine.ERR_NULL, Engine.analyzeFaces(pic, size[0], size[1], 1, null));
        assertEquals(Engine.ERR_NULL, Engine.analyzeFaces(pic, size[0], size[1] + 1, 1, new int[11]));
        assertEquals(Engine.ERR_NULL, Engine.analyzeFaces(pic, -size[0], size[1], 1, new int[11]));
    }

    @Test
    void noFaceInACoffeeCup() throws IOException {
        int[] size = new int[2];
        int[] pic = greyPicture("coffee_256.pgm", size);
        assertEquals(0, Engine.analyzeFaces(pic, size[0], size[1], 3, new int[20 * Engine.FACE_REPORT_INTS]));
    }
}
