"""encode, decode, convert and compare as a user runs them, one feeding the other."""

import unittest

import tool


def sums(*arguments, **streams):
    """The checksums of the pictures, a line each."""
    return tool.run("decode", *arguments, "-o", "-", "--format", "hash", **streams).out


class VideoCommands(tool.TestCase):
    def test_encode_into_files_that_decode_alike(self):
        # To the same pictures, on every road into the decoder.
        stream, mp4, decoded = (self.directory / name for name in ("a.264", "a.mp4", "decoded.y4m"))
        scene = ["encode", "-s", "96x80", "-n", 25, "--fps", 12.5, "-k", 10, "-o"]
        figures = self.report(*scene, stream)
        self.assertFields(figures, frames_encoded=25, key_frames=3, bytes=stream.stat().st_size)
        self.assertEqual(self.report(*scene, mp4)["frames_encoded"], 25)
        fragments = self.write("fragments.mp4", tool.run(*scene, "-", "--format", "mp4").out)

        expected = sums(stream)
        self.assertEqual(expected.count(b"\n"), 25)
        self.assertTrue(expected.startswith(b"0 96x80 "), expected)
        for path in (mp4, fragments):
            self.assertEqual(sums(path), expected, path)
        self.assertEqual(sums("-", stdin=stream), expected)
        self.assertEqual(self.report("decode", mp4)["fps"], 12.5)
        # The way through the media libraries gives the same pictures as the device's decoder.
        self.report("decode", mp4, "-o", decoded)
        self.assertFields(self.report("compare", mp4, decoded), frames_compared=25, psnr_y=100, ssim_y=1)

        content = mp4.read_bytes()
        cut = self.write("cut.mp4", content[:len(content) // 2])
        for command in ("call", "decode", "encode"):
            self.assertEnds(tool.run(command, cut), tool.INPUT, "cut.mp4")

    def test_write_png_pictures_by_number(self):
        scene = ["convert", "-s", "64x48", "-n", 3, "-o"]
        self.report(*scene, self.directory / "p-%03d.png")
        self.assertEqual(len(self.names()), 3)
        # What comes back from RGB differs by its rounding.
        original = self.directory / "original.y4m"
        self.report(*scene, original)
        difference = self.report("compare", self.directory / "p-000.png", original)
        self.assertEqual(difference["frames_only_in_second"], 2)
        self.assertGreater(difference["psnr_y"], 35)
        ended = tool.run("convert", "-n", 2, "-o", self.directory / "one.png")
        self.assertEnds(ended, tool.OUTPUT, "frame-%04d.png")

    def test_convert_there_and_back(self):
        names = ("original.y4m", "a.raw", "back.y4m", "turned.y4m", "link.y4m")
        original, raw, back, turned, link = (self.directory / name for name in names)
        self.report("convert", "-s", "96x64", "-n", 2, "-o", original)
        for layout in ("yv12", "nv12", "nv21", "yuy2", "uyvy"):
            self.report("convert", original, "--to", layout, "-o", raw)
            self.report("convert", raw, "-s", "96x64", "--from", layout, "-o", back)
            difference = self.report("compare", original, back)
            self.assertEqual(difference["psnr_y"], 100, layout)
            self.assertGreater(difference["psnr_u"], 30, layout)
        sizes = self.report("convert", original, "--rotate", 90, "--pad", "96x128", "-o", turned)
        self.assertFields(sizes, width=96, height=128)
        link.symlink_to(back.name)
        self.report("convert", turned, "--cut", "64x96", "--rotate", 270, "-o", link)
        self.assertTrue(back.read_bytes() == original.read_bytes())
        self.assertTrue(link.is_symlink())
        self.report("convert", original, "--scale", "192x128", "-o", turned)
        self.report("convert", turned, "--scale", "96x64", "-o", back)
        self.assertGreater(self.report("compare", original, back)["ssim_y"], 0.75)


if __name__ == "__main__":
    unittest.main()
