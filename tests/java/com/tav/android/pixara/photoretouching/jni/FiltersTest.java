package com.tav.android.pixara.photoretouching.jni;

import static org.junit.jupiter.api.Assertions.assertArrayEquals;
import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertNotEquals;

import java.util.Arrays;
import org.junit.jupiter.api.Nested;
import org.junit.jupiter.api.Test;

/** The filters through the bridge: partial rule, textures, alpha, refused arrays. */
class FiltersTest {
    static final int W = 8;
    static final int H = 5;

    static int[] picture(long seed) {
        return TestPictures.random(W * H, seed);
    }

    static int[] filled(int value) {
        return TestPictures.filled(W * H, value);
    }

    @Nested
    class TextureOverlays {
        @Test
        void screenOfBlackOnBlackGivesOne() {
            // Light streak of black under a black texture: the chain keeps
            // black, the screen lifts it to 1 and the alpha stays.
            int[] out = new int[W * H];
            Engine.applyLightStreak(filled(0x40000000), out, filled(0xFF000000), W, H);
            assertArrayEquals(filled(0x40010101), out);
        }

        @Test
        void partialCopiesOnlySelectedPixelsAndLeavesTheRest() {
            int[] in = picture(1);
            int[] tex = picture(2);
            int[] whole = new int[W * H];
            Engine.applyStardust(in, whole, tex, W, H);
            byte[] mask = new byte[W * H];
            mask[W + 1] = 1;
            mask[W + 2] = 2;
            int[] out = filled(7);
            Engine.applyStardustPartial(in, mask, out, tex, W, H, new Rect(0, 0, 3, 2));
            for (int i = 0; i < out.length; i++) {
                assertEquals(i == W + 1 ? whole[i] : 7, out[i], "pixel " + i);
            }
            out = filled(7);
            Engine.applyStardustPartial(in, null, out, tex, W, H, Rect.whole());
            assertArrayEquals(whole, out);
        }

        @Test
        void dawnCastTakesOverlayThenScreen() {
            int[] in = picture(3);
            int[] a = new int[W * H];
            int[] b = new int[W * H];
            Engine.applyDawnCast(in, a, picture(4), picture(5), W, H);
            Engine.applyDawnCast(in, b, picture(5), picture(4), W, H);
            assertNotEquals(Arrays.toString(a), Arrays.toString(b));
            int[] c = filled(9);
            Engine.applyDawnCastPartial(in, null, c, picture(4), picture(5), W, H, Rect.whole());
            assertArrayEquals(a, c);
        }

        @Test
        void shortOrNullTextureWritesNothing() {
            int[] out = filled(3);
            Engine.applySunburst(picture(1), out, new int[W * H - 1], W, H);
            assertArrayEquals(filled(3), out);
            Engine.applyOldPhotoTexturePartial(picture(1), new byte[W * H], out, null, W, H, Rect.whole());
            assertArrayEquals(filled(3), out);
            Engine.applyDawnCast(picture(1), out, picture(2), null, W, H);
            assertArrayEquals(filled(3), out);
        }
    }

    @Nested
    class ToneLooks {
        @Test
        void wholeAndPartialAgreeAndKeepAlpha() {
            int[] in = picture(6);
            int[] whole = new int[W * H];
            int[] part = new int[W * H];
            Engine.applyRetro(in, whole, W, H);
            Engine.applyRetroPartial(in, null, part, W, H, new Rect(3, 0, 2, 0));  // empty: whole picture
            assertArrayEquals(whole, part);
            for (int i = 0; i < in.length; i++) {
                assertEquals(in[i] >>> 24, whole[i] >>> 24);
            }
        }

        @Test
        void shortMaskIsRefusedForARectangle() {
            int[] out = filled(5);
            Engine.applySunshinePartial(picture(1), new byte[3], out, W, H, new Rect(0, 0, 1, 1));
            assertArrayEquals(filled(5), out);
            Engine.applyBluewash(picture(1), new int[2], W, H);  // short output: nothing happens
        }

        @Test
        void sharpenPartialClearsTheMaskForAnEmptyRectangle() {
            int[] in = picture(7);
            int[] all = new int[W * H];
            Engine.applySharpen(in, all, W, H);
            byte[] mask = new byte[W * H];
            Arrays.fill(mask, (byte) 5);
            int[] out = new int[W * H];
            Engine.applySharpenPartial(in, mask, out, W, H, Rect.whole());
            assertArrayEquals(all, out);
            assertArrayEquals(new byte[W * H], mask);
        }

        @Test
        void popArtAndDesignedLooksDiffer() {
            int[] in = picture(8);
            int[] a = new int[W * H];
            int[] b = new int[W * H];
            int[] c = new int[W * H];
            Engine.applyPopArt(in, a, W, H);
            Engine.applyOldPhoto(in, b, W, H);
            Engine.applySoftglow(in, c, W, H);
            assertNotEquals(Arrays.toString(a), Arrays.toString(b));
            assertNotEquals(Arrays.toString(b), Arrays.toString(c));
            int[] d = new int[W * H];
            Engine.applyDownlight(in, d, W, H);
            int[] e = filled(1);
            byte[] mask = new byte[W * H];
            mask[0] = 1;
            Engine.applyDownlightPartial(in, mask, e, W, H, new Rect(0, 0, 0, 0));
            assertEquals(d[0], e[0]);
            assertEquals(1, e[1]);
        }
    }

    @Nested
    class ShaderStyle {
        @Test
        void turquoiseOfBlackAndWhiteKeepsAlpha() {
            int[] out = new int[W * H];
            Engine.applyTurquoise(filled(0x33000000), out, W, H);
            assertArrayEquals(filled(0x33131D33), out);
            Engine.applyTurquoise(filled(0xFFFFFFFF), out, W, H);
            assertArrayEquals(filled(0xFFC6CFE6), out);
        }

        @Test
        void partialLeavesUnselectedOutputUntouched() {
            int[] in = picture(9);
            int[] whole = new int[W * H];
            Engine.applyRainbow(in, whole, W, H);
            byte[] mask = new byte[W * H];
            mask[2] = 1;
            mask[3] = 2;
            int[] out = filled(4);
            Engine.applyRainbowPartial(in, mask, out, W, H, new Rect(0, 0, 5, 0));
            for (int i = 0; i < out.length; i++) {
                assertEquals(i == 2 ? whole[i] : 4, out[i], "pixel " + i);
            }
            out = filled(4);
            Engine.applyGothicNoirPartial(in, null, out, W, H, Rect.whole());
            int[] noir = new int[W * H];
            Engine.applyGothicNoir(in, noir, W, H);
            assertArrayEquals(noir, out);
        }

        @Test
        void textureMembersTakeTheirTexturesInOrder() {
            int[] in = picture(10);
            int[] a = new int[W * H];
            int[] b = new int[W * H];
            Engine.applyStucchevole(in, a, picture(11), picture(12), picture(13), W, H);
            Engine.applyStucchevole(in, b, picture(13), picture(12), picture(11), W, H);
            assertNotEquals(Arrays.toString(a), Arrays.toString(b));
            int[] c = filled(0);
            Engine.applyStucchevolePartial(in, null, c, picture(11), picture(12), picture(13), W, H, Rect.whole());
            assertArrayEquals(a, c);
            int[] d = new int[W * H];
            int[] e = filled(0);
            Engine.applyImpressionist(in, d, picture(14), picture(15), W, H);
            Engine.applyImpressionistPartial(in, null, e, picture(14), picture(15), W, H, Rect.whole());
            assertArrayEquals(d, e);
        }

        @Test
        void refusedArraysWriteNothing() {
            int[] out = filled(6);
            Engine.applyNoirNote(picture(1), out, null, W, H);
            Engine.applyRugged(picture(1), out, new int[1], W, H);
            Engine.applyOilPastelPartial(picture(1), new byte[1], out, picture(2), W, H, new Rect(0, 0, 1, 1));
            Engine.applyVignette(null, out, W, H);
            Engine.applyStucchevolePartial(picture(1), null, out, picture(2), picture(3), null, W, H, Rect.whole());
            assertArrayEquals(filled(6), out);
        }
    }
}
