// Measures the backlight correction on backlit versions of sample photos
// whose original is known, beside a plain global gamma and the automatic
// adjustment, and times it.
//
//   java -Djava.library.path=build -cp build/glimmer.jar bench/BacklightMeasure.java samples-dir [out-dir]
//
// A backlit picture is made from a photo by darkening an elliptical subject
// (channels times 0.35) and brightening the rest (the distance to white
// times 0.45). Reported per photo and method: the mean absolute error against
// the photo inside the subject, and the mean and 99th-percentile change of
// the bright region against the backlit picture.
import com.tav.android.pixara.photoretouching.jni.Engine;

import java.awt.image.BufferedImage;
import java.io.File;
import java.util.Arrays;
import javax.imageio.ImageIO;

public class BacklightMeasure {
    static boolean inSubject(int x, int y, int w, int h) {
        double dx = (x - 0.5 * w) / (0.28 * w);
        double dy = (y - 0.55 * h) / (0.38 * h);
        return dx * dx + dy * dy <= 1;
    }

    static int[] backlit(int[] o, int w, int h) {
        int[] b = new int[o.length];
        for (int y = 0; y < h; y++) {
            for (int x = 0; x < w; x++) {
                int p = o[y * w + x];
                boolean s = inSubject(x, y, w, h);
                int q = p & 0xFF000000;
                for (int sh = 16; sh >= 0; sh -= 8) {
                    int c = (p >> sh) & 255;
                    int v = s ? (int) Math.round(c * 0.35) : (int) Math.round(255 - (255 - c) * 0.45);
                    q |= v << sh;
                }
                b[y * w + x] = q;
            }
        }
        return b;
    }

    static int[] globalGamma(int[] in, double gamma) {
        int[] t = new int[256];
        for (int i = 0; i < 256; i++) {
            t[i] = (int) Math.round(255 * Math.pow(i / 255.0, gamma));
        }
        int[] out = new int[in.length];
        for (int i = 0; i < in.length; i++) {
            int p = in[i];
            out[i] = (p & 0xFF000000) | t[(p >> 16) & 255] << 16 | t[(p >> 8) & 255] << 8 | t[p & 255];
        }
        return out;
    }

    static double[] score(int[] orig, int[] lit, int[] out, int w, int h) {
        double errSubject = 0;
        long ns = 0;
        int[] change = new int[w * h];
        int nb = 0;
        double sumChange = 0;
        for (int y = 0; y < h; y++) {
            for (int x = 0; x < w; x++) {
                int i = y * w + x;
                if (inSubject(x, y, w, h)) {
                    for (int sh = 16; sh >= 0; sh -= 8) {
                        errSubject += Math.abs(((out[i] >> sh) & 255) - ((orig[i] >> sh) & 255));
                    }
                    ns += 3;
                } else {
                    int m = 0;
                    for (int sh = 16; sh >= 0; sh -= 8) {
                        int d = Math.abs(((out[i] >> sh) & 255) - ((lit[i] >> sh) & 255));
                        sumChange += d;
                        m = Math.max(m, d);
                    }
                    change[nb++] = m;
                }
            }
        }
        int[] c = Arrays.copyOf(change, nb);
        Arrays.sort(c);
        return new double[] {errSubject / ns, sumChange / (3.0 * nb), c[(int) (nb * 0.99)]};
    }

    static void row(String photo, String method, double[] s) {
        System.out.printf("| %s | %s | %.1f | %.2f | %.0f |%n", photo, method, s[0], s[1], s[2]);
    }

    public static void main(String[] args) throws Exception {
        File dir = new File(args.length > 0 ? args[0] : "build/samples");
        File outDir = args.length > 1 ? new File(args[1]) : null;
        System.out.println("| photo | method | subject error vs original | bright region mean change | 99% change |");
        System.out.println("|---|---|---|---|---|");
        File[] files = dir.listFiles((d, n) -> n.endsWith(".png"));
        Arrays.sort(files);
        for (File f : files) {
            BufferedImage img = ImageIO.read(f);
            int w = img.getWidth();
            int h = img.getHeight();
            int[] orig = img.getRGB(0, 0, w, h, null, 0, w);
            int[] lit = backlit(orig, w, h);
            String name = f.getName().replace(".png", "");
            row(name, "backlit input", score(orig, lit, lit, w, h));
            int[] g = globalGamma(lit, 0.5);
            row(name, "global gamma 0.5", score(orig, lit, g, w, h));
            int[] auto = new int[lit.length];
            Engine.applyAutoAdjust(lit, auto, w, h);
            row(name, "automatic adjustment", score(orig, lit, auto, w, h));
            int[] out = new int[lit.length];
            Engine.autoBLCInit(lit, w, h);
            for (int strength : new int[] {50, 100}) {
                Engine.applyBLCSave(lit, out, w, h, strength);
                row(name, "backlight strength " + strength, score(orig, lit, out, w, h));
                if (outDir != null) {
                    outDir.mkdirs();
                    BufferedImage o = new BufferedImage(w, h, BufferedImage.TYPE_INT_ARGB);
                    o.setRGB(0, 0, w, h, out, 0, w);
                    ImageIO.write(o, "png", new File(outDir, name + "-blc" + strength + ".png"));
                }
            }
            if (outDir != null) {
                BufferedImage o = new BufferedImage(w, h, BufferedImage.TYPE_INT_ARGB);
                o.setRGB(0, 0, w, h, lit, 0, w);
                ImageIO.write(o, "png", new File(outDir, name + "-backlit.png"));
                o.setRGB(0, 0, w, h, g, 0, w);
                ImageIO.write(o, "png", new File(outDir, name + "-gamma.png"));
            }
            Engine.DeInitBLC();
        }
        System.out.println();
        System.out.println("| size | init | preview (first) | preview (again) | save |");
        System.out.println("|---|---|---|---|---|");
        for (int[] size : new int[][] {{2000, 1500}, {4000, 3000}}) {
            int w = size[0];
            int h = size[1];
            BufferedImage img = ImageIO.read(files[0]);
            int sw = img.getWidth();
            int sh = img.getHeight();
            int[] small = backlit(img.getRGB(0, 0, sw, sh, null, 0, sw), sw, sh);
            int[] big = new int[w * h];
            for (int y = 0; y < h; y++) {
                for (int x = 0; x < w; x++) {
                    big[y * w + x] = small[(y * sh / h) * sw + x * sw / w];
                }
            }
            int[] out = new int[big.length];
            long[] t = new long[4];
            for (int rep = 0; rep < 3; rep++) {
                long t0 = System.nanoTime();
                Engine.autoBLCInit(big, w, h);
                long t1 = System.nanoTime();
                Engine.applyGammaTransformPreview(big, out, w, h, 60);
                long t2 = System.nanoTime();
                Engine.applyGammaTransformPreview(big, out, w, h, 80);
                long t3 = System.nanoTime();
                Engine.applyBLCSave(big, out, w, h, 80);
                long t4 = System.nanoTime();
                Engine.DeInitBLC();
                if (rep == 0 || t1 - t0 < t[0]) t[0] = t1 - t0;
                if (rep == 0 || t2 - t1 < t[1]) t[1] = t2 - t1;
                if (rep == 0 || t3 - t2 < t[2]) t[2] = t3 - t2;
                if (rep == 0 || t4 - t3 < t[3]) t[3] = t4 - t3;
            }
            System.out.printf("| %d x %d (%.0f MP) | %d ms | %d ms | %d ms | %d ms |%n", w, h, w * h / 1e6,
                    t[0] / 1000000, t[1] / 1000000, t[2] / 1000000, t[3] / 1000000);
        }
    }
}
