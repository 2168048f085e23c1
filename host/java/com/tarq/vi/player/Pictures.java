package com.tarq.vi.player;

import java.awt.Color;
import java.awt.Graphics2D;
import java.awt.RenderingHints;
import java.awt.image.BufferedImage;
import java.io.IOException;
import java.nio.file.Path;
import java.util.ArrayList;
import java.util.List;
import javax.imageio.IIOImage;
import javax.imageio.ImageIO;
import javax.imageio.ImageTypeSpecifier;
import javax.imageio.ImageWriter;
import javax.imageio.metadata.IIOMetadata;
import javax.imageio.metadata.IIOMetadataNode;
import javax.imageio.stream.ImageOutputStream;

/**
 * The pictures of a render: every frame as PNG, a contact sheet of chosen
 * frames labelled with their times, an animated GIF preview, and the diff
 * pictures of frames that differ from their references. Frames of
 * another orientation are fitted, letterboxed, into the first frame's shape.
 */
final class Pictures implements AutoCloseable {
    static final String SHEET = "contact-sheet.png";
    static final String PREVIEW = "preview.gif";

    private static final int SHEET_COLUMNS = 4;
    private static final double SHEET_SCALE = 1.0 / 3.0;
    private static final double PREVIEW_SCALE = 0.5;
    private static final int PREVIEW_FPS = 15;

    private final Path folder;
    private final int cellWidth;
    private final int cellHeight;
    private final int previewWidth;
    private final int previewHeight;
    private final int previewEvery;
    private final List<Integer> sheetIndices = new ArrayList<>();
    private final List<BufferedImage> sheetCells = new ArrayList<>();
    private final ImageWriter gifWriter;
    private final ImageOutputStream gifStream;
    /** The first frame carries the looping extension; the rest only their delay. */
    private final IIOMetadata gifFirstFrameMetadata;
    private final IIOMetadata gifFrameMetadata;
    private boolean gifStarted;
    private boolean gifClosed;

    Pictures(Path folder, int width, int height, int fps, int frameCount, int sheetFrames) throws IOException {
        this.folder = folder;
        cellWidth = Math.max(1, (int) Math.round(width * SHEET_SCALE));
        cellHeight = Math.max(1, (int) Math.round(height * SHEET_SCALE));
        previewWidth = Math.max(1, (int) Math.round(width * PREVIEW_SCALE));
        previewHeight = Math.max(1, (int) Math.round(height * PREVIEW_SCALE));
        previewEvery = Math.max(1, Math.round(fps / (float) PREVIEW_FPS));

        int shown = Math.min(sheetFrames, frameCount);
        for (int i = 0; i < shown; ++i) {
            sheetIndices.add(shown == 1 ? 0 : (int) Math.round(i * (frameCount - 1) / (double) (shown - 1)));
        }

        gifWriter = ImageIO.getImageWritersByFormatName("gif").next();
        gifStream = ImageIO.createImageOutputStream(folder.resolve(PREVIEW).toFile());
        gifWriter.setOutput(gifStream);
        int delay = Math.max(1, Math.round(100f * previewEvery / fps));
        gifFirstFrameMetadata = frameMetadata(delay, true);
        gifFrameMetadata = frameMetadata(delay, false);
        gifWriter.prepareWriteSequence(null);
    }

    static String frameName(int index) {
        return String.format("frame-%05d.png", index);
    }

    /** How frame `index` differs from its reference, beside the frame. */
    static String diffName(int index) {
        return String.format("diff-%05d.png", index);
    }

    void addDiff(int index, BufferedImage picture) throws IOException {
        ImageIO.write(picture, "png", folder.resolve(diffName(index)).toFile());
    }

    /** Writes frame `index` (drawn at `seconds`) and keeps what the sheet and the preview need of it. */
    void add(int index, double seconds, BufferedImage frame) throws IOException {
        ImageIO.write(frame, "png", folder.resolve(frameName(index)).toFile());
        if (sheetIndices.contains(index)) {
            BufferedImage cell = fitted(frame, cellWidth, cellHeight);
            Labels.draw(cell, String.format(java.util.Locale.ROOT, "%.2fs", seconds), 4, cellHeight - 4);
            sheetCells.add(cell);
        }
        if (index % previewEvery == 0) {
            IIOMetadata metadata = gifStarted ? gifFrameMetadata : gifFirstFrameMetadata;
            gifWriter.writeToSequence(new IIOImage(fitted(frame, previewWidth, previewHeight), null, metadata), null);
            gifStarted = true;
        }
    }

    /** Finishes the preview and writes the contact sheet. */
    void finish() throws IOException {
        gifWriter.endWriteSequence();
        gifStream.close();
        gifClosed = true;
        int columns = Math.min(SHEET_COLUMNS, Math.max(1, sheetCells.size()));
        int rows = (sheetCells.size() + columns - 1) / columns;
        int gap = 4;
        BufferedImage sheet = new BufferedImage(columns * (cellWidth + gap) + gap, Math.max(1, rows) * (cellHeight + gap) + gap,
            BufferedImage.TYPE_INT_RGB);
        Graphics2D g = sheet.createGraphics();
        g.setColor(new Color(24, 24, 28));
        g.fillRect(0, 0, sheet.getWidth(), sheet.getHeight());
        for (int i = 0; i < sheetCells.size(); ++i) {
            g.drawImage(sheetCells.get(i), gap + (i % columns) * (cellWidth + gap), gap + (i / columns) * (cellHeight + gap),
                null);
        }
        g.dispose();
        ImageIO.write(sheet, "png", folder.resolve(SHEET).toFile());
    }

    @Override
    public void close() throws IOException {
        if (!gifClosed) gifStream.close();
        gifWriter.dispose();
    }

    /** The frame scaled to fit the box, centred on black. */
    private static BufferedImage fitted(BufferedImage frame, int width, int height) {
        BufferedImage box = new BufferedImage(width, height, BufferedImage.TYPE_INT_RGB);
        double scale = Math.min(width / (double) frame.getWidth(), height / (double) frame.getHeight());
        int w = Math.max(1, (int) Math.round(frame.getWidth() * scale));
        int h = Math.max(1, (int) Math.round(frame.getHeight() * scale));
        Graphics2D g = box.createGraphics();
        g.setRenderingHint(RenderingHints.KEY_INTERPOLATION, RenderingHints.VALUE_INTERPOLATION_BILINEAR);
        g.setRenderingHint(RenderingHints.KEY_RENDERING, RenderingHints.VALUE_RENDER_QUALITY);
        g.drawImage(frame, (width - w) / 2, (height - h) / 2, w, h, null);
        g.dispose();
        return box;
    }

    /** Per-frame GIF metadata: the delay, no disposal, and, when asked, endless looping. */
    private IIOMetadata frameMetadata(int delayHundredths, boolean loop) throws IOException {
        ImageTypeSpecifier type = ImageTypeSpecifier.createFromBufferedImageType(BufferedImage.TYPE_INT_RGB);
        IIOMetadata metadata = gifWriter.getDefaultImageMetadata(type, null);
        String format = metadata.getNativeMetadataFormatName();
        IIOMetadataNode root = (IIOMetadataNode) metadata.getAsTree(format);

        IIOMetadataNode control = child(root, "GraphicControlExtension");
        control.setAttribute("disposalMethod", "none");
        control.setAttribute("userInputFlag", "FALSE");
        control.setAttribute("transparentColorFlag", "FALSE");
        control.setAttribute("delayTime", Integer.toString(delayHundredths));
        control.setAttribute("transparentColorIndex", "0");

        if (loop) {
            IIOMetadataNode extensions = child(root, "ApplicationExtensions");
            IIOMetadataNode repeat = new IIOMetadataNode("ApplicationExtension");
            repeat.setAttribute("applicationID", "NETSCAPE");
            repeat.setAttribute("authenticationCode", "2.0");
            repeat.setUserObject(new byte[] {1, 0, 0});  // sub-block 1: repeat count 0, for ever
            extensions.appendChild(repeat);
        }

        metadata.setFromTree(format, root);
        return metadata;
    }

    private static IIOMetadataNode child(IIOMetadataNode root, String name) {
        for (int i = 0; i < root.getLength(); ++i) {
            if (root.item(i).getNodeName().equalsIgnoreCase(name)) return (IIOMetadataNode) root.item(i);
        }
        IIOMetadataNode node = new IIOMetadataNode(name);
        root.appendChild(node);
        return node;
    }
}
