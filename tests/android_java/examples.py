#!/usr/bin/env python3
# SPDX-FileCopyrightText: the libjni_kyface_api authors
# SPDX-License-Identifier: Apache-2.0
"""Writes the Java and Kotlin examples of documents as sources that a compiler takes.

examples.py --java FOLDER --kotlin FOLDER DOCUMENT...

A block that declares a class becomes a source of its own; in Java, statements become a method of a class that has what
they take for granted. Blocks of a build script are left out. Prints how many of each were written.
"""
import argparse
import re
from pathlib import Path

IMPORTS = """
android.content.Context android.graphics.Bitmap android.graphics.Canvas android.graphics.Color android.graphics.Paint
android.graphics.PointF android.graphics.Rect android.media.Image android.util.AttributeSet android.util.Log
android.view.View androidx.camera.core.ImageAnalysis androidx.camera.core.ImageProxy com.vantrel.faceapi.*
com.vantrel.faceapi.model.FaceInfo java.nio.ByteBuffer java.util.Collections java.util.List
java.util.concurrent.ExecutorService
""".split()
# Kotlin has its own collections.
JAVA_ONLY = {"java.util.Collections", "java.util.List"}

# What the statements of the documents take for granted.
GIVEN = """
  protected String modelPath;
  protected byte[] nv21;
  protected int width, height, yRowStride, uRowStride, uPixelStride, vRowStride, vPixelStride, rotation;
  protected int rotationDegrees;
  protected boolean isFrontCamera;
  protected ByteBuffer y, u, v;
  protected CameraFrame frame;
  protected YuvPlanes planes;
  protected FrameTransform transform;
  protected Image image;
  protected Bitmap bitmap;
  protected View preview;
  protected FaceInfo face;
  protected FaceVerifier verifier;
  protected List<Feature> album;
  protected abstract void draw(Object... what);
"""


def blocks(document, language):
    """The blocks of a document in a language; of a Java source those of its classes' descriptions."""
    text = document.read_text()
    if document.suffix == ".java":
        if language == "java":
            for block in re.findall(r"<pre>\{@code\n(.*?)\n \* \}</pre>", text, re.DOTALL):
                yield re.sub(r"(?m)^ \* ?", "", block)
        return
    for block in re.findall(rf"^```{language}\n(.*?)^```$", text, re.DOTALL | re.MULTILINE):
        if not block.startswith("// app/build.gradle"):
            yield block


def declared(block):
    match = re.search(r"^(?:public |final |abstract )*class (\w+)", block, re.MULTILINE)
    return match and match.group(1)


def main():
    parser = argparse.ArgumentParser(description=__doc__.splitlines()[0])
    parser.add_argument("--java", type=Path, required=True)
    parser.add_argument("--kotlin", type=Path, required=True)
    parser.add_argument("documents", type=Path, nargs="+")
    arguments = parser.parse_args()
    counts = {}
    for language, folder, suffix in (("java", arguments.java, ".java"), ("kotlin", arguments.kotlin, ".kt")):
        folder.mkdir(parents=True, exist_ok=True)
        end = ";\n" if language == "java" else "\n"
        imports = "".join(f"import {name}{end}" for name in IMPORTS if language == "java" or name not in JAVA_ONLY)
        head = f"package examples{end}{imports}\n"
        counts[language] = 0
        for document in arguments.documents:
            for block in blocks(document, language):
                counts[language] += 1
                name = declared(block)
                if not name:
                    if language == "kotlin":
                        raise SystemExit(f"{document}: an example in Kotlin that declares no class:\n{block}")
                    name = f"Example{counts[language]}"
                    block = (f"abstract class {name} {{{GIVEN}  void example() throws Exception {{\n{block}\n"
                             "  }\n}\n")
                (folder / (name + suffix)).write_text(head + block)
    print(counts["java"], counts["kotlin"])


if __name__ == "__main__":
    main()
