# SPDX-FileCopyrightText: the libjni_kyface_api authors
# SPDX-License-Identifier: Apache-2.0
"""OpenCV as Python's package has it, which is newer than the system's: `scripts/setup.sh opencv` brings it. Its C++
functions are not exported, so Python calls it; what the operations do is told by their names."""

import importlib
import mmap
import re
import sys

LAYOUTS_420 = ["NV21", "NV12", "I420", "YUV"]
CHANNELS = {"BGRA": 4, "RGBA": 4, "GRAY": 1}
CROP_MARGIN = 8


class NewerOpencv:
    """`version`, and what it calls for an operation. ImportError where there is no such package in `folder`."""

    def __init__(self, folder):
        if not folder.exists():
            raise ImportError(f"there is no {folder}")
        sys.path.insert(0, str(folder))
        self._cv2, self._numpy = importlib.import_module("cv2"), importlib.import_module("numpy")
        self._cv2.setNumThreads(1)
        self.version = self._cv2.__version__

    def prepared(self, name, size):
        """The call that makes operation `name` of a picture; None where Python has none for it."""
        if match := re.fullmatch(r"(\w+)-to-(\w+?)(-f32)?", name):
            return self._conversion(match[1], match[2], "f32" if match[3] else "u8", size)
        if match := re.fullmatch(r"rotate(90|180|270)-(u8|f32)x(\d)", name):
            return self._rotation(int(match[1]), match[2], int(match[3]), size)
        if match := re.fullmatch(r"crop-(u8|f32)x(\d)", name):
            return self._crop(match[1], int(match[2]), size)
        if match := re.fullmatch(r"calcGray_(YUV|BGRA|RGBA)", name):
            return self._mean(match[1], size)
        return None

    def _picture(self, width, height, channels, sample):
        """Random samples on pages of their own, as the other libraries' are."""
        kind = self._numpy.uint8 if sample == "u8" else self._numpy.float32
        count = width * height * channels
        memory = mmap.mmap(-1, count * kind().itemsize, flags=mmap.MAP_PRIVATE | mmap.MAP_ANONYMOUS)
        samples = self._numpy.frombuffer(memory, kind)
        random = self._numpy.random.default_rng(1)
        samples[:] = random.integers(0, 256, count) if sample == "u8" else random.random(count, kind)
        return samples.reshape((height, width, channels) if channels > 1 else (height, width))

    def _into(self, destination, function, *arguments):
        """A call of the function that leaves its result in `destination`."""
        result = function(*arguments)
        if not self._numpy.shares_memory(result, destination):
            raise ValueError("OpenCV did not take the destination")
        return lambda: function(*arguments)

    def _conversion(self, source, target, sample, size):
        if source in LAYOUTS_420:
            codes = [f"COLOR_YUV2{target}_{source}", f"COLOR_YUV2{target}_420"]
        elif target in LAYOUTS_420:
            codes = [f"COLOR_{source}2YUV_{target}"]
        else:
            # It takes four channels as three where it has no code for them: the fourth is ignored, or made.
            codes = [f"COLOR_{source}2{target}", f"COLOR_{source.removesuffix('A')}2{target.removesuffix('A')}"]
        code = next((getattr(self._cv2, code) for code in codes if hasattr(self._cv2, code)), None)
        if code is None:
            return None

        def side(layout):
            if layout in LAYOUTS_420:
                return self._picture(size[0], size[1] * 3 // 2, 1, sample)
            return self._picture(*size, CHANNELS.get(layout, 3), sample)

        destination = side(target)
        channels = 0 if target in LAYOUTS_420 else CHANNELS.get(target, 3)
        return self._into(destination, self._cv2.cvtColor, side(source), code, destination, channels)

    def _rotation(self, angle, sample, channels, size):
        code = {90: self._cv2.ROTATE_90_CLOCKWISE, 180: self._cv2.ROTATE_180, 270: self._cv2.ROTATE_90_COUNTERCLOCKWISE}
        destination = self._picture(*(size if angle == 180 else size[::-1]), channels, sample)
        return self._into(destination, self._cv2.rotate, self._picture(*size, channels, sample), code[angle], destination)

    def _crop(self, sample, channels, size):
        width, height = size
        whole = self._picture(width + 2 * CROP_MARGIN, height + 2 * CROP_MARGIN, channels, sample)
        region = whole[CROP_MARGIN:CROP_MARGIN + height, CROP_MARGIN:CROP_MARGIN + width]
        destination = self._picture(width, height, channels, sample)
        return self._into(destination, self._cv2.copyTo, region, None, destination)

    def _mean(self, layout, size):
        mean = self._cv2.mean
        if layout == "YUV":
            source = self._picture(*size, 3, "u8")
            return lambda: mean(source)
        gray = self._picture(*size, 1, "u8")
        code = getattr(self._cv2, f"COLOR_{layout}2GRAY")
        convert = self._into(gray, self._cv2.cvtColor, self._picture(*size, 4, "u8"), code, gray)
        return lambda: (convert(), mean(gray))
