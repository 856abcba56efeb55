// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertFalse;
import static org.junit.Assert.assertNotNull;
import static org.junit.Assert.assertTrue;

import java.io.BufferedReader;
import java.io.DataInputStream;
import java.io.File;
import java.io.IOException;
import java.io.InputStream;
import java.io.InputStreamReader;
import java.lang.reflect.Method;
import java.lang.reflect.Modifier;
import java.net.URL;
import java.net.URLClassLoader;
import java.nio.charset.StandardCharsets;
import java.nio.file.Files;
import java.nio.file.Path;
import java.nio.file.StandardCopyOption;
import java.util.ArrayList;
import java.util.Arrays;
import java.util.List;
import java.util.Set;
import java.util.TreeSet;
import java.util.regex.Matcher;
import java.util.regex.Pattern;
import java.util.stream.Collectors;
import java.util.zip.ZipEntry;
import java.util.zip.ZipFile;
import javax.xml.parsers.DocumentBuilderFactory;
import org.junit.Test;
import org.w3c.dom.Element;

/** The Android package: what is in it, and that what is in it fits together. */
public final class PackageTest {
    private static final File SOURCE = new File(System.getProperty("kyface.source"));
    private static final String VERSION = System.getProperty("kyface.version");
    private static final String LLVM = System.getProperty("kyface.llvm");
    private static final File FOLDER = new File(SOURCE, "out/package");
    private static final String LIBRARY = "jni/arm64-v8a/libjni_kyface_api.so";
    private static final String ENGINE = "jni/arm64-v8a/libkyface_api.so";
    private static final String MODULE = "prefab/modules/jni_kyface_api/";

    private static File aar() {
        return new File(FOLDER, "faceapi-" + VERSION + "-linux-aarch64.aar");
    }

    private static File engine() {
        return new File(FOLDER, "faceapi-engine-" + VERSION + "-linux-aarch64.aar");
    }

    private static Path extracted(String entry) throws IOException {
        return extracted(aar(), entry);
    }

    private static Path extracted(File archive, String entry) throws IOException {
        Path file = new File(System.getProperty("kyface.work"), new File(entry).getName()).toPath();
        try (ZipFile zip = new ZipFile(archive); InputStream in = zip.getInputStream(zip.getEntry(entry))) {
            Files.copy(in, file, StandardCopyOption.REPLACE_EXISTING);
        }
        return file;
    }

    private static String text(String entry) throws IOException {
        return new String(Files.readAllBytes(extracted(entry)), StandardCharsets.UTF_8);
    }

    private static List<String> run(String... command) throws IOException, InterruptedException {
        Process process = new ProcessBuilder(command).redirectErrorStream(true).start();
        List<String> lines = new ArrayList<>();
        try (BufferedReader out = new BufferedReader(new InputStreamReader(process.getInputStream()))) {
            for (String line = out.readLine(); line != null; line = out.readLine()) {
                lines.add(line);
            }
        }
        assertEquals(String.join("\n", lines), 0, process.waitFor());
        return lines;
    }

    @Test
    public void holdsExactlyItsEntries() throws IOException {
        Set<String> entries;
        try (ZipFile zip = new ZipFile(aar())) {
            entries = zip.stream().map(ZipEntry::getName).collect(Collectors.toCollection(TreeSet::new));
        }
        assertEquals(new TreeSet<>(Arrays.asList("AndroidManifest.xml", "LICENSE", "NOTICE.txt", "R.txt",
                "README.txt", "classes.jar", LIBRARY, "prefab/prefab.json", MODULE + "module.json", MODULE + "include/fastcv/fastcv.h",
                MODULE + "libs/android.arm64-v8a/abi.json", MODULE + "libs/android.arm64-v8a/libjni_kyface_api.so",
                "proguard.txt")), entries);
        for (String beside : new String[] {"-sources.jar", "-javadoc.jar", ".pom"}) {
            assertTrue(beside, new File(FOLDER, "faceapi-" + VERSION + beside).length() > 0);
        }
        assertTrue(new File(FOLDER, "symbols/arm64-v8a/libjni_kyface_api.so").length() > 0);
    }

    @Test
    public void theEngineHoldsExactlyItsEntries() throws IOException {
        Set<String> entries;
        try (ZipFile zip = new ZipFile(engine())) {
            entries = zip.stream().map(ZipEntry::getName).collect(Collectors.toCollection(TreeSet::new));
        }
        assertEquals(new TreeSet<>(Arrays.asList("AndroidManifest.xml", "LICENSE", "NOTICE.txt", "R.txt",
                "README.txt", "classes.jar", ENGINE)), entries);
        assertTrue(new File(FOLDER, "symbols/arm64-v8a/libkyface_api.so").length() > 0);
        String notices = new String(Files.readAllBytes(extracted(engine(), "NOTICE.txt")), StandardCharsets.UTF_8);
        assertTrue(notices.contains("Boost Software License - Version 1.0"));
        try (ZipFile jar = new ZipFile(extracted(engine(), "classes.jar").toFile())) {
            assertEquals(0, jar.stream().filter(entry -> entry.getName().endsWith(".class")).count());
        }
    }

    /** It has its C++ library in it, all that the other library asks for, and no folder of this machine. */
    @Test
    public void theEngineIsWhatTheLibraryAsksFor() throws Exception {
        String library = extracted(engine(), ENGINE).toString();
        int segments = 0;
        for (String line : run("llvm-readelf-" + LLVM, "-dlW", library)) {
            String[] columns = line.trim().split("\\s+");
            if (columns[0].equals("LOAD")) {
                segments++;
                assertTrue(line, Long.decode(columns[columns.length - 1]) >= 16384);
            }
            assertTrue(line, !line.contains("(NEEDED)") || line.matches(".*\\[(lib[cm]|ld-linux-aarch64)\\.so\\.\\d+]"));
            assertTrue(line, !line.contains("(SONAME)") || line.contains("[libkyface_api.so]"));
        }
        assertTrue(segments > 1);
        Set<String> exported =
                new TreeSet<>(run("llvm-nm-" + LLVM, "-D", "--defined-only", "-j", library));
        for (String name : exported) {
            assertTrue(name, name.startsWith("ky_"));
        }
        Set<String> asked = new TreeSet<>();
        for (String line : run("llvm-nm-" + LLVM, "-D", "--undefined-only", "-j", extracted(LIBRARY).toString())) {
            if (line.startsWith("ky_")) {
                asked.add(line);
            }
        }
        assertFalse(asked.isEmpty());
        asked.removeAll(exported);
        assertEquals(new TreeSet<String>(), asked);
        String bytes = new String(Files.readAllBytes(new File(library).toPath()), StandardCharsets.ISO_8859_1);
        assertFalse("names the project's folder", bytes.contains(SOURCE.getPath()));
    }

    @Test
    public void manifestsAndPomsParse() throws Exception {
        parse(aar(), "faceapi", "com.vantrel.faceapi");
        parse(engine(), "faceapi-engine", "com.vantrel.faceapi.engine");
    }

    private static void parse(File archive, String artifact, String name) throws Exception {
        DocumentBuilderFactory parser = DocumentBuilderFactory.newInstance();
        parser.setNamespaceAware(true);
        Element manifest = parser.newDocumentBuilder().parse(extracted(archive, "AndroidManifest.xml").toFile())
                .getDocumentElement();
        assertEquals(name, manifest.getAttribute("package"));
        Element sdk = (Element) manifest.getElementsByTagName("uses-sdk").item(0);
        assertEquals("24", sdk.getAttributeNS("http://schemas.android.com/apk/res/android", "minSdkVersion"));
        Element pom = parser.newDocumentBuilder().parse(new File(FOLDER, artifact + "-" + VERSION + ".pom"))
                .getDocumentElement();
        assertEquals(artifact, pom.getElementsByTagName("artifactId").item(0).getTextContent());
        assertEquals(VERSION, pom.getElementsByTagName("version").item(0).getTextContent());
        assertEquals("aar", pom.getElementsByTagName("packaging").item(0).getTextContent());
    }

    /** Flat JSON objects of strings, numbers, booleans and empty arrays, as prefab's are. */
    private static final Pattern JSON = Pattern.compile(
            "\\s*\\{(\\s*\"\\w+\"\\s*:\\s*(\"[^\"\\\\]*\"|\\d+|true|false|\\[\\s*])\\s*(,(?!\\s*})|(?=})))+\\s*}\\s*");

    @Test
    public void prefabDescribesTheLibrary() throws IOException {
        String prefab = text("prefab/prefab.json");
        String module = text(MODULE + "module.json");
        String abi = text(MODULE + "libs/android.arm64-v8a/abi.json");
        for (String json : new String[] {prefab, module, abi}) {
            assertTrue(json, JSON.matcher(json).matches());
            assertFalse("a placeholder was left: " + json, json.contains("@"));
        }
        assertTrue(prefab.contains("\"version\": \"" + VERSION + "\""));
        assertTrue(module.contains("\"library_name\": \"libjni_kyface_api\""));
        assertTrue(abi.contains("\"abi\": \"arm64-v8a\"") && abi.contains("\"api\": 24"));
    }

    @Test
    public void classesLoadAndAreOfJava8() throws Exception {
        File jar = extracted("classes.jar").toFile();
        URL[] path = {jar.toURI().toURL(), new File(System.getProperty("kyface.android")).toURI().toURL()};
        int classes = 0;
        try (ZipFile zip = new ZipFile(jar);
                URLClassLoader loader = new URLClassLoader(path, ClassLoader.getSystemClassLoader().getParent())) {
            for (ZipEntry entry : zip.stream().collect(Collectors.toList())) {
                if (!entry.getName().endsWith(".class")) {
                    continue;
                }
                assertTrue(entry.getName(), entry.getName().startsWith("com/vantrel/faceapi/"));
                try (DataInputStream in = new DataInputStream(zip.getInputStream(entry))) {
                    assertEquals(0xCAFEBABE, in.readInt());
                    in.readUnsignedShort();
                    assertEquals(entry.getName(), 52, in.readUnsignedShort());
                }
                String name = entry.getName().replace('/', '.').replaceFirst("\\.class$", "");
                assertNotNull(Class.forName(name, false, loader).getDeclaredMethods());
                classes++;
            }
            assertTrue(classes > 10);
            nativeMethodsAreThoseOfTheLibrary(loader);
        }
    }

    /** The classes with native methods. */
    private static final String[] NATIVE = {"FaceLibrary", "PixelConversion", "PlaneConversion"};

    private static void nativeMethodsAreThoseOfTheLibrary(ClassLoader loader) throws Exception {
        Set<String> declared = new TreeSet<>();
        for (String name : NATIVE) {
            for (Method method : Class.forName("com.vantrel.faceapi." + name, false, loader).getDeclaredMethods()) {
                if (Modifier.isNative(method.getModifiers())) {
                    declared.add("Java_com_vantrel_faceapi_" + name + "_" + method.getName());
                }
            }
        }
        Set<String> exported = new TreeSet<>();
        for (String line : run("llvm-nm-" + LLVM, "-D", "--defined-only", "-j", extracted(LIBRARY).toString())) {
            if (line.startsWith("Java_")) {
                exported.add(line);
            }
        }
        assertEquals(declared, exported);
    }

    /** What native code looks up by name must be named by the rules that keep it. */
    @Test
    public void shrinkingKeepsWhatNativeCodeLooksUp() throws IOException {
        String rules = text("proguard.txt");
        for (String name : NATIVE) {
            assertTrue(rules.contains("-keep class com.vantrel.faceapi." + name + " {\n    native <methods>;\n}"));
        }
        int start = rules.indexOf("-keep class com.vantrel.faceapi.model.FaceInfo {");
        assertTrue(start >= 0);
        String kept = rules.substring(start, rules.indexOf('}', start));
        assertTrue(kept.contains("<init>();"));

        String registry = new String(
                Files.readAllBytes(new File(SOURCE, "jni/java_model.cpp").toPath()), StandardCharsets.UTF_8);
        Matcher table = Pattern.compile("const field fields\\[] = \\{\n(.*?)\n};", Pattern.DOTALL).matcher(registry);
        assertTrue("the registry's table was not found", table.find());
        String[] rows = table.group(1).split("\n");
        Pattern row = Pattern.compile("\\{(k\\w+), \"(\\w+)\", \"([^\"]+)\", .*");
        int ours = 0;
        for (String line : rows) {
            Matcher entry = row.matcher(line.trim());
            assertTrue("not understood: " + line, entry.matches());
            if (entry.group(1).equals("kFaceInfoClass")) {
                ours++;
                assertTrue(entry.group(2) + " is not kept",
                        kept.contains("    " + javaType(entry.group(3)) + " " + entry.group(2) + ";\n"));
            } else {
                // The system's own classes are not shrunk.
                assertTrue(line, entry.group(1).matches("kRectClass|kPointFClass"));
            }
        }
        assertTrue(ours > 0);
    }

    private static String javaType(String signature) {
        switch (signature.charAt(0)) {
            case 'I': return "int";
            case 'F': return "float";
            case '[': return javaType(signature.substring(1)) + "[]";
            default: return signature.substring(1, signature.length() - 1).replace('/', '.');
        }
    }

    @Test
    public void theLibraryIsFitForAPhone() throws Exception {
        String library = extracted(LIBRARY).toString();
        int segments = 0;
        for (String line : run("llvm-readelf-" + LLVM, "-lW", library)) {
            String[] columns = line.trim().split("\\s+");
            if (columns[0].equals("LOAD")) {
                segments++;
                assertTrue(line, Long.decode(columns[columns.length - 1]) >= 16384);
            }
        }
        assertTrue(segments > 1);
        boolean engine = false;
        for (String line : run("llvm-readelf-" + LLVM, "-d", library)) {
            assertFalse(line, line.contains("TEXTREL"));
            engine |= line.contains("[libkyface_api.so]");
        }
        assertTrue("the engine is not imported", engine);
        boolean sections = false;
        for (String line : run("llvm-readelf-" + LLVM, "-SW", library)) {
            assertFalse("not stripped: " + line, line.contains(" .symtab "));
            sections |= line.contains(".note.gnu.build-id");
        }
        assertTrue("no build id", sections);
    }

    /** The imports are a kept list: each of them is in Android's system libraries at API level 24. */
    @Test
    public void importsNothingThatAndroidLacks() throws Exception {
        Set<String> kept = new TreeSet<>();
        for (String line : Files.readAllLines(new File(SOURCE, "android/imports.txt").toPath())) {
            if (!line.isEmpty() && !line.startsWith("#")) {
                kept.add(line);
            }
        }
        Set<String> imported = new TreeSet<>();
        for (String line : run(
                "llvm-nm-" + LLVM, "-D", "--undefined-only", "--no-weak", "-j", extracted(LIBRARY).toString())) {
            String name = line.replaceFirst("@.*", "");
            // The engine's come with the app.
            if (!name.startsWith("ky_")) {
                imported.add(name);
            }
        }
        imported.removeAll(kept);
        assertEquals(new TreeSet<String>(), imported);
    }

    /** The examples of the documentation compile, between the names that they take for granted. */
    @Test
    public void examplesCompile() throws Exception {
        Pattern block = Pattern.compile("<pre>\\{@code\n(.*?)\n \\* }</pre>", Pattern.DOTALL);
        StringBuilder methods = new StringBuilder();
        int examples = 0;
        for (String name : new String[] {"FaceDetector", "CameraFrame", "YuvPlanes"}) {
            File file = new File(SOURCE, "java/com/vantrel/faceapi/" + name + ".java");
            Matcher example = block.matcher(new String(Files.readAllBytes(file.toPath()), StandardCharsets.UTF_8));
            while (example.find()) {
                methods.append("  void example").append(examples++).append("() {\n")
                        .append(example.group(1).replaceAll("(?m)^ \\* ?", "    ")).append("\n  }\n");
            }
        }
        assertTrue("the examples were not found", examples >= 3);
        Path folder = Files.createDirectories(new File(System.getProperty("kyface.work"), "examples").toPath());
        Path source = folder.resolve("Examples.java");
        Files.write(source, ("import com.vantrel.faceapi.*;\nimport com.vantrel.faceapi.model.*;\n"
                + "import java.nio.ByteBuffer;\nabstract class Examples {\n  CameraFrame frame;\n"
                + "  int width, height, yRowStride, uRowStride, uPixelStride, vRowStride, vPixelStride, rotation;\n"
                + "  ByteBuffer y, u, v;\n  android.media.Image image;\n  android.graphics.Bitmap bitmap;\n"
                + "  FrameTransform transform;\n" + methods + "}\n").getBytes(StandardCharsets.UTF_8));
        run(System.getProperty("java.home") + "/bin/javac", "--release", "8", "-Xlint:-options", "-d",
                folder.toString(), "-cp",
                extracted("classes.jar") + File.pathSeparator + System.getProperty("kyface.android"),
                source.toString());
    }
}
