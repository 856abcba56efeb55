// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import java.io.ByteArrayOutputStream;
import java.io.File;
import java.io.IOException;
import java.io.InputStream;
import java.nio.charset.StandardCharsets;
import java.nio.file.Files;
import java.util.ArrayList;
import java.util.Arrays;
import java.util.Collections;
import java.util.List;

/** A class's main method in a JVM of its own, whose output can be looked at, native output included. */
final class Child {
    final int exitStatus;
    final String output;
    final List<String> errors;

    private Child(int exitStatus, String output, List<String> errors) {
        this.exitStatus = exitStatus;
        this.output = output;
        this.errors = errors;
    }

    static Child run(Class<?> main, String... arguments) throws IOException, InterruptedException {
        return run(System.getProperty("java.class.path"), Collections.<String>emptyList(), main, arguments);
    }

    static Child run(String classPath, List<String> options, Class<?> main, String... arguments)
            throws IOException, InterruptedException {
        List<String> command = new ArrayList<>();
        command.add(System.getProperty("kyface.java"));
        command.add("-Xcheck:jni");
        command.add("-Dkyface.source=" + System.getProperty("kyface.source"));
        command.addAll(options);
        command.addAll(Arrays.asList("-cp", classPath, main.getName()));
        command.addAll(Arrays.asList(arguments));
        File errors = File.createTempFile("kyface", ".err");
        try {
            Process process = new ProcessBuilder(command).redirectError(errors).start();
            String output = read(process.getInputStream());
            int exitStatus = process.waitFor();
            return new Child(exitStatus, output, Files.readAllLines(errors.toPath(), StandardCharsets.UTF_8));
        } finally {
            if (!errors.delete()) {
                errors.deleteOnExit();
            }
        }
    }

    private static String read(InputStream in) throws IOException {
        ByteArrayOutputStream out = new ByteArrayOutputStream();
        byte[] buffer = new byte[4096];
        for (int n = in.read(buffer); n >= 0; n = in.read(buffer)) {
            out.write(buffer, 0, n);
        }
        return new String(out.toByteArray(), StandardCharsets.UTF_8);
    }
}
