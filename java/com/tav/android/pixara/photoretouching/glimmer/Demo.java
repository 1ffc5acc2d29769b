package com.tav.android.pixara.photoretouching.glimmer;

import com.tav.android.pixara.photoretouching.glimmer.Operations.Job;
import com.tav.android.pixara.photoretouching.glimmer.Operations.Operation;
import com.tav.android.pixara.photoretouching.glimmer.Operations.OperationException;

import java.awt.Color;
import java.awt.Font;
import java.awt.Graphics2D;
import java.awt.RenderingHints;
import java.awt.image.BufferedImage;
import java.io.File;
import java.io.IOException;
import java.io.PrintStream;
import java.util.Arrays;
import java.util.List;
import javax.imageio.ImageIO;

/**
 * {@code glimmer demo}: every operation, with its demo values, on every sample
 * photo; one PNG a result, and a labelled contact sheet {@code contact-sheet.png}.
 * Regional operations are shown on a centred ellipse selection.
 */
final class Demo {
    private static final int THUMB = 150;
    private static final int LABEL = 16;
    private static final int COLUMNS = 12;

    private Demo() {
    }

    static void run(File samples, File outDir, PrintStream out)
            throws Glimmer.UsageException, OperationException, IOException {
        File[] files = samples.listFiles((d, n) -> n.endsWith(".png") || n.endsWith(".jpg") || n.endsWith(".jpeg"));
        if (files == null || files.length == 0) {
            throw new Glimmer.UsageException("no sample photos in " + samples + " (./run demo fetches them)");
        }
        Arrays.sort(files);
        if (!outDir.isDirectory() && !outDir.mkdirs()) {
            throw new IOException("cannot create " + outDir);
        }
        List<Operation> ops = Operations.all();
        // Each photo starts a new block of rows: the original, then every operation, COLUMNS a row.
        int rowsPerPhoto = (ops.size() + 1 + COLUMNS - 1) / COLUMNS;
        BufferedImage sheet = new BufferedImage(COLUMNS * THUMB, files.length * rowsPerPhoto * (THUMB + LABEL),
                BufferedImage.TYPE_INT_RGB);
        Graphics2D g = sheet.createGraphics();
        g.setColor(Color.WHITE);
        g.fillRect(0, 0, sheet.getWidth(), sheet.getHeight());
        g.setRenderingHint(RenderingHints.KEY_INTERPOLATION, RenderingHints.VALUE_INTERPOLATION_BILINEAR);
        g.setFont(new Font(Font.SANS_SERIF, Font.PLAIN, 11));
        int row = 0;
        for (File f : files) {
            Picture pic = Picture.read(f);
            String base = f.getName().replaceFirst("\\.[^.]+$", "");
            int top = row * rowsPerPhoto * (THUMB + LABEL);
            cell(g, pic.image(pic.pixels), 0, top, base);
            int col = 1;
            for (Operation op : ops) {
                int[] rect = op.regional() ? demoRect(pic, op) : null;
                Job job = pic.job(op.defaults(true), rect);
                op.action().apply(job);
                File result = new File(outDir, base + "-" + op.name() + ".png");
                Picture.write(job.result(), job.resultWidth(), job.resultHeight(), result);
                if (job.preview != null) {
                    // The selection tools show their overlay; the mask is written as well.
                    Picture.write(job.preview, job.width, job.height, new File(outDir, base + "-" + op.name()
                            + "-overlay.png"));
                }
                int[] shown = job.preview != null ? job.preview : job.result();
                cell(g, Picture.image(shown, job.resultWidth(), job.resultHeight()), (col % COLUMNS) * THUMB,
                        top + (col / COLUMNS) * (THUMB + LABEL), op.name());
                col++;
            }
            out.println("demo: " + base + ": " + ops.size() + " results");
            row++;
        }
        g.dispose();
        File sheetFile = new File(outDir, "contact-sheet.png");
        ImageIO.write(sheet, "png", sheetFile);
        out.println("wrote " + sheetFile);
    }

    private static int[] demoRect(Picture pic, Operation op) {
        double[] f = op.demoRegion() != null ? op.demoRegion() : new double[] {1 / 6.0, 1 / 6.0, 5 / 6.0, 5 / 6.0};
        return new int[] {(int) (pic.width * f[0]), (int) (pic.height * f[1]), (int) (pic.width * f[2]),
            (int) (pic.height * f[3])};
    }

    private static void cell(Graphics2D g, BufferedImage img, int x, int y, String label) {
        double s = Math.min((double) (THUMB - 4) / img.getWidth(), (double) (THUMB - 4) / img.getHeight());
        int w = (int) (img.getWidth() * s);
        int h = (int) (img.getHeight() * s);
        g.drawImage(img, x + (THUMB - w) / 2, y + (THUMB - h) / 2, w, h, null);
        g.setColor(Color.BLACK);
        g.drawString(label, x + 4, y + THUMB + LABEL - 4);
    }
}
