"""The resource module generator rejects bad text sources with the file and line at fault."""
import os
import subprocess
import sys
import tempfile
import unittest

GENERATOR = sys.argv.pop(1)
HEADER = sys.argv.pop(1)


class GeneratorTest(unittest.TestCase):
    def run_generator(self, **sources):
        with tempfile.TemporaryDirectory() as folder:
            args = [sys.executable, GENERATOR, "--language", "407", "--output", os.path.join(folder, "out.cpp")]
            for kind, text in sources.items():
                path = os.path.join(folder, kind)
                with open(path, "w", encoding="utf-8") as f:
                    f.write(text)
                args += [f"--{kind}", path]
            if "oem" in sources:
                args += ["--oem-header", HEADER]
            result = subprocess.run(args, capture_output=True, text=True)
            output = ""
            if result.returncode == 0:
                with open(os.path.join(folder, "out.cpp"), encoding="utf-8") as f:
                    output = f.read()
            return result.returncode, result.stderr, output

    def assertRejected(self, message, **sources):
        code, stderr, _ = self.run_generator(**sources)
        self.assertNotEqual(code, 0)
        self.assertIn(message, stderr)

    def test_good_sources(self):
        code, stderr, out = self.run_generator(
            strings='# comment\n1 "a"\n0x10 "b\\u00e9"\n',
            messages="MessageId=5\nSymbolicName=X\nline one\nline two\n.\n",
            oem="[__OEMData]\ndwMajorVersion = 19\nszText24 = abc\naszText600[2] = x\n")
        self.assertEqual(code, 0, stderr)
        self.assertIn("0x0062, 0x00E9, 0x0000", out)  # "bé" in UTF-16
        self.assertIn("0x0065, 0x0020, 0x006F, 0x006E, 0x0065, 0x000D, 0x000A", out)  # "...e one\r\n"
        self.assertIn("kOwResourceMagic, kOwResourceVersion, 0x407", out)
        self.assertIn("r.aszText600[2]", out)

    def test_string_errors(self):
        self.assertRejected(":3: error: string 1 is defined twice", strings='1 "a"\n\n1 "b"\n')
        self.assertRejected(":1: error: expected", strings="1 a\n")
        self.assertRejected("out of range", strings='65536 "a"\n')
        self.assertRejected("is empty", strings='2 ""\n')
        self.assertRejected("unknown escape", strings='2 "\\q"\n')

    def test_message_errors(self):
        self.assertRejected("not ended", messages="MessageId=1\ntext\n")
        self.assertRejected("defined twice", messages="MessageId=1\na\n.\nMessageId=1\nb\n.\n")
        self.assertRejected("has no text", messages="MessageId=1\n.\n")

    def test_oem_errors(self):
        self.assertRejected("has no field 'szNothing'", oem="[__OEMData]\nszNothing = x\n")
        self.assertRejected("the field holds 15", oem="[__OEMData]\nszText24 = 0123456789abcdef\n")
        self.assertRejected("outside Windows-1252", oem="[__OEMData]\nszText24 = \u4e2d\n")
        self.assertRejected("unknown record", oem="[__Other]\n")
        self.assertRejected("out of range", oem="[__OEMData]\nbyValue3224 = 256\n")
        self.assertRejected("needs an index", oem="[__OEMData]\naszText600 = x\n")


if __name__ == "__main__":
    unittest.main()
