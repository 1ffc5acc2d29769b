package com.tav.android.pixara.photoretouching.glimmer;

import java.util.Random;

/**
 * Textures for the texture filters and the shader-style effects, drawn here
 * from a seed: the same size and seed always give the same pixels. Every
 * texture is an opaque 0xAARRGGBB picture of the requested size.
 *
 * <ul>
 * <li>{@link #lightStreak}: black with a few long, soft diagonal beams of warm light (for screen blends).</li>
 * <li>{@link #starField}: black with scattered stars of random brightness, the brightest with a four-point
 * spike (for screen blends).</li>
 * <li>{@link #sunFlare}: black with a warm sun glow near an upper corner and faint coloured lens ghosts
 * along the line through the centre (for screen blends).</li>
 * <li>{@link #paper}: a paper surface of a given base colour with fine grain and short darker fibres.</li>
 * <li>{@link #grain}: neutral mid-grey (128) grain, which leaves a picture's tones in place under an
 * overlay blend and serves as film grain.</li>
 * <li>{@link #jitter}: red, green and blue each uniform over 0..255, independently, in 2 x 2 cells: a field of
 * random moves (mid-grey is no move) for the impressionist strokes.</li>
 * </ul>
 */
public final class Textures {
    private Textures() {
    }

    private static int clamp(double v) {
        return v < 0 ? 0 : v > 255 ? 255 : (int) v;
    }

    private static int argb(double r, double g, double b) {
        return 0xFF000000 | clamp(r) << 16 | clamp(g) << 8 | clamp(b);
    }

    /** Adds light (r, g, b scaled by k) to the three-channel accumulator at pixel i. */
    private static void add(double[] acc, int i, double k, double r, double g, double b) {
        acc[3 * i] += k * r;
        acc[3 * i + 1] += k * g;
        acc[3 * i + 2] += k * b;
    }

    private static int[] pack(double[] acc, int n) {
        int[] t = new int[n];
        for (int i = 0; i < n; i++) {
            t[i] = argb(acc[3 * i], acc[3 * i + 1], acc[3 * i + 2]);
        }
        return t;
    }

    /**
     * Three to five beams, each a line through a random point at 25 to 60
     * degrees below the horizontal; across a beam the light falls off as a
     * Gaussian of 3 to 8 percent of the shorter side, along it it fades out
     * towards the lower right. Colour warm white (255, 225, 180).
     */
    public static int[] lightStreak(int width, int height, long seed) {
        Random rnd = new Random(seed);
        double[] acc = new double[3 * width * height];
        int beams = 3 + rnd.nextInt(3);
        double side = Math.min(width, height);
        for (int k = 0; k < beams; k++) {
            double px = rnd.nextDouble() * width;
            double py = rnd.nextDouble() * height * 0.6;
            double angle = Math.toRadians(25 + rnd.nextDouble() * 35);
            double dx = Math.cos(angle);
            double dy = Math.sin(angle);
            double sigma = side * (0.03 + rnd.nextDouble() * 0.05);
            double peak = 90 + rnd.nextDouble() * 80;
            double reach = Math.hypot(width, height);
            for (int y = 0; y < height; y++) {
                for (int x = 0; x < width; x++) {
                    double rx = x - px;
                    double ry = y - py;
                    double across = -rx * dy + ry * dx;
                    double along = rx * dx + ry * dy;
                    double fade = Math.max(0, 1 - Math.abs(along) / reach);
                    double v = Math.exp(-across * across / (2 * sigma * sigma)) * fade;
                    if (v > 0.002) {
                        add(acc, y * width + x, v * peak / 255, 255, 225, 180);
                    }
                }
            }
        }
        return pack(acc, width * height);
    }

    /**
     * One star in about 300 pixels, brightness 40 to 255 with a faint blue or
     * gold tint; one star in 40 also gets a four-point spike of 4 to 12
     * pixels that fades linearly, and a 3 x 3 halo.
     */
    public static int[] starField(int width, int height, long seed) {
        Random rnd = new Random(seed);
        double[] acc = new double[3 * width * height];
        int stars = Math.max(1, width * height / 300);
        for (int s = 0; s < stars; s++) {
            int x = rnd.nextInt(width);
            int y = rnd.nextInt(height);
            double v = 40 + rnd.nextDouble() * 215;
            boolean gold = rnd.nextBoolean();
            double r = gold ? 255 : 215;
            double g = gold ? 240 : 230;
            double b = gold ? 200 : 255;
            add(acc, y * width + x, v / 255, r, g, b);
            if (rnd.nextInt(40) == 0) {
                int len = 4 + rnd.nextInt(9);
                for (int d = 1; d <= len; d++) {
                    double k = v / 255 * (1 - (double) d / (len + 1));
                    int[][] pts = {{x + d, y}, {x - d, y}, {x, y + d}, {x, y - d}};
                    for (int[] p : pts) {
                        if (p[0] >= 0 && p[0] < width && p[1] >= 0 && p[1] < height) {
                            add(acc, p[1] * width + p[0], k, r, g, b);
                        }
                    }
                }
                for (int j = -1; j <= 1; j++) {
                    for (int i = -1; i <= 1; i++) {
                        if ((i != 0 || j != 0) && x + i >= 0 && x + i < width && y + j >= 0 && y + j < height) {
                            add(acc, (y + j) * width + x + i, v / 255 * 0.35, r, g, b);
                        }
                    }
                }
            }
        }
        return pack(acc, width * height);
    }

    /**
     * A sun near the upper left or upper right corner (chosen by the seed):
     * a bright core (Gaussian, 4 percent of the diagonal) over a wide warm
     * glow that falls off as exp(-3 r / diagonal); then four ghosts, faint
     * discs of orange, green and violet tints placed along the line from the
     * sun through the picture's centre.
     */
    public static int[] sunFlare(int width, int height, long seed) {
        Random rnd = new Random(seed);
        double[] acc = new double[3 * width * height];
        double diag = Math.hypot(width, height);
        double sx = (rnd.nextBoolean() ? 0.15 + rnd.nextDouble() * 0.15 : 0.70 + rnd.nextDouble() * 0.15) * width;
        double sy = (0.10 + rnd.nextDouble() * 0.15) * height;
        double core = 0.04 * diag;
        double[][] ghosts = new double[4][];
        double[][] tints = {{255, 170, 80}, {140, 255, 160}, {190, 140, 255}, {255, 210, 120}};
        for (int k = 0; k < 4; k++) {
            double t = 0.6 + k * 0.35 + rnd.nextDouble() * 0.1;
            ghosts[k] = new double[] {sx + (width / 2.0 - sx) * t, sy + (height / 2.0 - sy) * t,
                diag * (0.02 + rnd.nextDouble() * 0.04)};
        }
        for (int y = 0; y < height; y++) {
            for (int x = 0; x < width; x++) {
                int i = y * width + x;
                double r = Math.hypot(x - sx, y - sy);
                add(acc, i, Math.exp(-r * r / (2 * core * core)), 255, 250, 230);
                add(acc, i, 0.75 * Math.exp(-3 * r / diag), 255, 170, 70);
                for (int k = 0; k < 4; k++) {
                    double d = Math.hypot(x - ghosts[k][0], y - ghosts[k][1]);
                    double edge = ghosts[k][2];
                    if (d < edge) {
                        double soft = 1 - (d / edge) * (d / edge);
                        add(acc, i, 0.18 * soft, tints[k][0], tints[k][1], tints[k][2]);
                    }
                }
            }
        }
        return pack(acc, width * height);
    }

    /**
     * Paper of base colour (r, g, b): every pixel moves by a uniform grain of
     * -12..12 on all channels together; then one fibre per 500 pixels, a
     * straight stroke of 3 to 10 pixels in a random direction, darkens its
     * pixels by 18.
     */
    public static int[] paper(int width, int height, long seed, int r, int g, int b) {
        Random rnd = new Random(seed);
        int n = width * height;
        int[] d = new int[n];
        for (int i = 0; i < n; i++) {
            d[i] = rnd.nextInt(25) - 12;
        }
        int fibres = n / 500;
        for (int f = 0; f < fibres; f++) {
            double x = rnd.nextInt(width);
            double y = rnd.nextInt(height);
            double a = rnd.nextDouble() * Math.PI;
            int len = 3 + rnd.nextInt(8);
            for (int s = 0; s < len; s++) {
                int xi = (int) (x + s * Math.cos(a));
                int yi = (int) (y + s * Math.sin(a));
                if (xi >= 0 && xi < width && yi >= 0 && yi < height) {
                    d[yi * width + xi] -= 18;
                }
            }
        }
        int[] t = new int[n];
        for (int i = 0; i < n; i++) {
            t[i] = argb(r + d[i], g + d[i], b + d[i]);
        }
        return t;
    }

    /** Cream paper (236, 226, 204) with grain and fibres. */
    public static int[] paper(int width, int height, long seed) {
        return paper(width, height, seed, 236, 226, 204);
    }

    /** Neutral grain: paper of base grey 128. */
    public static int[] grain(int width, int height, long seed) {
        return paper(width, height, seed, 128, 128, 128);
    }

    /** Random moves: each 2 x 2 cell gets independent uniform red, green and blue values 0..255. */
    public static int[] jitter(int width, int height, long seed) {
        Random rnd = new Random(seed);
        int cw = (width + 1) / 2;
        int ch = (height + 1) / 2;
        int[] cells = new int[cw * ch];
        for (int i = 0; i < cells.length; i++) {
            cells[i] = 0xFF000000 | rnd.nextInt(0x1000000);
        }
        int[] t = new int[width * height];
        for (int y = 0; y < height; y++) {
            for (int x = 0; x < width; x++) {
                t[y * width + x] = cells[(y / 2) * cw + x / 2];
            }
        }
        return t;
    }
}
