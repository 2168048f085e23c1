import java.awt.image.BufferedImage;
import java.io.File;
import java.io.IOException;
import javax.imageio.ImageIO;

/**
 * The demo's wallpaper: an evening lake under mountains, painted from
 * formulas so that the repository keeps no picture. Run as a single source
 * file: java MakeWallpaper.java OUTPUT.png [WIDTH HEIGHT]
 */
public final class MakeWallpaper {
    private MakeWallpaper() {}

    public static void main(String[] args) throws IOException {
        if (args.length != 1 && args.length != 3) {
            System.err.println("usage: java MakeWallpaper.java OUTPUT.png [WIDTH HEIGHT]");
            System.exit(2);
        }
        int width = args.length == 3 ? Integer.parseInt(args[1]) : 720;
        int height = args.length == 3 ? Integer.parseInt(args[2]) : 1280;
        BufferedImage image = new BufferedImage(width, height, BufferedImage.TYPE_INT_RGB);
        for (int y = 0; y < height; ++y) {
            for (int x = 0; x < width; ++x) {
                image.setRGB(x, y, pixel(x / (double) width, y / (double) height, width / (double) height));
            }
        }
        File output = new File(args[0]);
        File partial = new File(args[0] + ".partial");
        if (!ImageIO.write(image, "png", partial) || !partial.renameTo(output)) {
            partial.delete();
            System.err.println("cannot write " + args[0]);
            System.exit(1);
        }
    }

    private static final double HORIZON = 0.56;
    private static final double SUN_X = 0.62;
    private static final double SUN_Y = 0.40;

    /** Colour at (u, v), v = 0 at the top; aspect = width / height. */
    private static int pixel(double u, double v, double aspect) {
        double[] c;
        if (v < HORIZON) {
            c = land(u, v, aspect);
        } else {
            // The lake mirrors the sky and the hills about the horizon, darker and bluer,
            // with a glittering path below the sun.
            double depth = (v - HORIZON) / (1 - HORIZON);
            double wave = 0.004 * Math.sin(u * 90 + depth * 40) * depth;
            double[] mirrored = land(u + wave, 2 * HORIZON - v - 0.002, aspect);
            double shade = 0.72 - 0.35 * depth;
            c = new double[] {mirrored[0] * shade * 0.85, mirrored[1] * shade * 0.95, mirrored[2] * shade + 0.05 * depth};
            double path = Math.exp(-Math.pow((u - SUN_X) / (0.05 + 0.12 * depth), 2));
            double glitter = Math.pow(0.5 + 0.5 * Math.sin(u * 230 + Math.sin(v * 170) * 3) * Math.sin(v * 520), 6);
            double streak = path * (0.25 + 0.9 * glitter) * (1 - 0.6 * depth);
            c = add(c, new double[] {1.0 * streak, 0.72 * streak, 0.42 * streak});
        }
        double vignette = 1 - 0.35 * Math.pow(Math.hypot((u - 0.5) * aspect * 1.2, v - 0.5), 2);
        return rgb(c[0] * vignette, c[1] * vignette, c[2] * vignette);
    }

    /** Sky, sun and three ranges of hills above the horizon. */
    private static double[] land(double u, double v, double aspect) {
        double t = Math.min(1, Math.max(0, v / HORIZON));
        double[] top = {0.07, 0.09, 0.25};
        double[] middle = {0.42, 0.26, 0.46};
        double[] low = {1.0, 0.58, 0.34};
        double[] sky = t < 0.6 ? mix(top, middle, t / 0.6) : mix(middle, low, (t - 0.6) / 0.4);
        double distance = Math.hypot((u - SUN_X) * aspect, v - SUN_Y);
        double sun = distance < 0.045 ? 1 : 0;
        double glow = Math.exp(-distance * 9) * 0.7;
        double[] c = add(sky, new double[] {glow, glow * 0.7, glow * 0.35});
        c = mix(c, new double[] {1.0, 0.93, 0.75}, sun);
        c = hills(c, u, v, 0.43, 0.06, 1.3, new double[] {0.36, 0.22, 0.38});
        c = hills(c, u, v, 0.48, 0.05, 2.7, new double[] {0.21, 0.13, 0.27});
        c = hills(c, u, v, 0.53, 0.035, 4.1, new double[] {0.09, 0.07, 0.14});
        return c;
    }

    private static double[] hills(double[] c, double u, double v, double base, double height, double seed,
                                  double[] colour) {
        double ridge = base - height * (0.55 + 0.3 * Math.sin(u * 7.1 + seed) + 0.15 * Math.sin(u * 17.3 + seed * 2)
            + 0.08 * Math.sin(u * 41 + seed * 3));
        if (v < ridge) return c;
        double haze = Math.max(0, 1 - (v - ridge) * 30) * 0.12;
        return add(colour, new double[] {haze, haze * 0.6, haze * 0.5});
    }

    private static double[] mix(double[] a, double[] b, double t) {
        return new double[] {a[0] + (b[0] - a[0]) * t, a[1] + (b[1] - a[1]) * t, a[2] + (b[2] - a[2]) * t};
    }

    private static double[] add(double[] a, double[] b) {
        return new double[] {a[0] + b[0], a[1] + b[1], a[2] + b[2]};
    }

    private static int rgb(double r, double g, double b) {
        return (channel(r) << 16) | (channel(g) << 8) | channel(b);
    }

    private static int channel(double value) {
        return (int) Math.round(255 * Math.min(1, Math.max(0, value)));
    }
}
