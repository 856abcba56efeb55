// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertTrue;

import java.io.IOException;
import java.lang.reflect.Field;
import java.lang.reflect.Modifier;
import java.nio.charset.StandardCharsets;
import java.nio.file.Files;
import java.nio.file.Paths;
import java.util.Map;
import java.util.Set;
import java.util.TreeMap;
import java.util.TreeSet;
import java.util.regex.Matcher;
import java.util.regex.Pattern;
import org.junit.Test;

/** The engine's header and its Java counterpart say the same. */
public class EngineValuesTest {
    /** Enumerators with their value, and macros with a value; KY_ in front. */
    private static final Pattern VALUE = Pattern.compile(
            "^(?:#define\\s+KY_(\\w+)\\s+(\\S+)|\\s*KY_(\\w+)\\s*=\\s*(-?\\w+),?)", Pattern.MULTILINE);

    private static Map<String, String> inHeader() throws IOException {
        byte[] bytes = Files.readAllBytes(Paths.get(System.getProperty("kyface.source"), "engine/include/engine/ky_engine.h"));
        Map<String, String> values = new TreeMap<>();
        Matcher m = VALUE.matcher(new String(bytes, StandardCharsets.UTF_8));
        while (m.find()) {
            String name = m.group(1) != null ? m.group(1) : m.group(3);
            String value = m.group(1) != null ? m.group(2) : m.group(4);
            if (value.startsWith("\"")) {
                values.put(name, value.substring(1, value.length() - 1));
            } else if (value.endsWith("f")) {
                values.put(name, String.valueOf(Float.parseFloat(value)));
            } else {
                values.put(name, String.valueOf(Integer.decode(value)));
            }
        }
        return values;
    }

    private static Map<String, String> inJava() throws IllegalAccessException {
        Map<String, String> values = new TreeMap<>();
        for (Field field : EngineValues.class.getFields()) {
            assertTrue(field.getName(), Modifier.isStatic(field.getModifiers()));
            values.put(field.getName(), String.valueOf(field.get(null)));
        }
        return values;
    }

    @Test
    public void headerAndClassAgree() throws IOException, IllegalAccessException {
        Map<String, String> header = inHeader();
        assertTrue("the header was not understood", header.size() > 20);
        Map<String, String> java = inJava();
        Set<String> names = new TreeSet<>(header.keySet());
        names.addAll(java.keySet());
        for (String name : names) {
            assertEquals(name, header.get(name), java.get(name));
        }
    }
}
