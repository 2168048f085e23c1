package com.tarq.vi.player;

import java.io.IOException;
import java.nio.file.Files;
import java.nio.file.Path;
import java.util.HashMap;
import java.util.List;
import java.util.Map;
import java.util.stream.Stream;

/**
 * The model files among an effect's assets, looked at before the effect
 * starts. The runtime uses a model file in place and unchecked, so a broken
 * one shows as a garbage picture or a crash that never names the file. Every
 * ".bin" asset is checked as a model file (as vi-modelconv --check does); one
 * that cannot be a model is warned about, once for each thing wrong with it,
 * and the effect runs all the same: an effect may keep other data in ".bin" files.
 */
final class AssetModels {
    private final String program;
    private final Path assets;
    /** What was last said about each file, so that a reload repeats nothing. */
    private final Map<Path, String> told = new HashMap<>();

    /** assets may be null: an effect without an asset folder. */
    AssetModels(String program, Path assets) {
        this.program = program;
        this.assets = assets;
    }

    void check() {
        if (assets == null) return;
        List<Path> files;
        try (Stream<Path> paths = Files.walk(assets)) {
            files = paths.filter(path -> path.toString().endsWith(".bin") && Files.isRegularFile(path)).sorted()
                .toList();
        } catch (IOException e) {
            return;  // the effect's own asset reads will say what is wrong with the folder
        }
        Map<Path, String> now = new HashMap<>();
        for (Path file : files) {
            String why = Desktop.whyNotModel(file.toString());
            if (why == null) continue;
            now.put(file, why);
            if (why.equals(told.get(file))) continue;
            System.err.println(program + ": warning: the asset " + assets.relativize(file)
                + " cannot be a model file: " + why);
            System.err.println("  " + file + " (the effect runs anyway: it may keep other data in .bin files)");
        }
        told.clear();
        told.putAll(now);
    }
}
