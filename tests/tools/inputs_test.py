"""Inputs that are cut short, hostile or slow."""

import os
import threading
import unittest

import tool

SIZE = ("--size", "4x2")
HEAD = b"YUV4MPEG2 W4 H2 F30:1\n"
FRAME = b"FRAME\n"


def picture(value):
    return value * (4 * 2 * 3 // 2)


class Inputs(tool.TestCase):
    def read(self, path, *arguments):
        """The input's pictures, as far as they can be read, on standard output."""
        return tool.run("convert", path, *arguments, "-o", "-", "--format", "raw")

    def test_are_read_up_to_what_is_wrong_with_them(self):
        a = picture(b"a")
        for content, arguments, pictures, complaint in (
                (b"", (), b"", "is empty"),
                (b"anything", (), b"", "--size"),
                (a + b"bbb", SIZE, a, "ends in the middle of picture 1 (3 of 12 bytes)"),
                (HEAD + FRAME + a, SIZE, b"", "leave --size out"),
                (HEAD + FRAME + a + FRAME + b"bb", (), a, "ends in the middle of picture 1"),
                (HEAD + FRAME + a + FRAME, (), a, "ends where frame 1 should have its picture"),
                (HEAD + b"FRAMES\n" + a, (), b"", "something else where frame 0"),
                (b"YUV4MPEG2 " + b"x" * 5000, (), b"", "no end of its Y4M header"),
                (b"YUV4MPEG2 W4\n", (), b"", "no picture size"),
                (b"YUV4MPEG2 W4 H-2\n", (), b"", 'bad header word "H-2"'),
                (b"YUV4MPEG2 W8192 H8194\n", (), b"", 'bad header word "H8194"'),
                (b"YUV4MPEG2 W4 H2 C422\n", (), b"", "yuv420p"),
                (b"YUV4MPEG2 W5 H2 F30:1\n", (), b"", "5x2 is an odd size")):
            with self.subTest(complaint):
                ended = self.read(self.write("in", content), *arguments)
                self.assertEnds(ended, tool.INPUT, complaint)
                self.assertIn("/in: ", ended.err)
                self.assertEqual(ended.out, pictures)

    def test_may_come_in_drops(self):
        path = self.directory / "pipe"
        os.mkfifo(path)

        def drip():
            with open(path, "wb", buffering=0) as pipe:
                for byte in HEAD + FRAME + picture(b"a") + FRAME + picture(b"b"):
                    pipe.write(bytes([byte]))

        writer = threading.Thread(target=drip)
        writer.start()
        ended = self.read(path)
        writer.join()
        self.assertEqual((ended.code, ended.out), (0, picture(b"a") + picture(b"b")))


if __name__ == "__main__":
    unittest.main()
