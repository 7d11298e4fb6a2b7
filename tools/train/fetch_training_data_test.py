"""Tests of scripts/fetch-training-data's unpacking and grouping helpers."""
import importlib.machinery
import importlib.util
import io
import os
import tarfile
import tempfile
import unittest
import zipfile

_PATH = os.path.join(os.path.dirname(os.path.abspath(__file__)), "..", "..", "scripts",
                     "fetch-training-data")
_loader = importlib.machinery.SourceFileLoader("fetch_training_data", _PATH)
_spec = importlib.util.spec_from_loader("fetch_training_data", _loader)
ftd = importlib.util.module_from_spec(_spec)
_loader.exec_module(ftd)


def tar_blob(members):
    buf = io.BytesIO()
    with tarfile.open(fileobj=buf, mode="w:gz") as t:
        for name, data, kind in members:
            info = tarfile.TarInfo(name)
            if kind == "link":
                info.type = tarfile.SYMTYPE
                info.linkname = "/etc/passwd"
                t.addfile(info)
            else:
                info.size = len(data)
                t.addfile(info, io.BytesIO(data))
    return buf.getvalue()


class StripPhpTest(unittest.TestCase):
    CASES = [
        (b"<p>a</p><?php echo 1; ?><p>b</p>", b"<p>a</p><p>b</p>"),
        (b"<?PHP\n$x = '?';\n?>\n<form>", b"\n<form>"),
        (b"<html><?php never closed", b"<html>"),  # an open block runs to the end
        (b"<?xml version='1.0'?><a/>", b"<?xml version='1.0'?><a/>"),
    ]

    def test_cases(self):
        for page, want in self.CASES:
            with self.subTest(page=page):
                self.assertEqual(ftd.strip_php(page), want)


class ArchiveTest(unittest.TestCase):
    def test_zip_and_tar_members(self):
        zbuf = io.BytesIO()
        with zipfile.ZipFile(zbuf, "w") as z:
            z.writestr("kit/index.php", b"<form>")
        self.assertEqual(ftd.archive_member(zbuf.getvalue(), "k.zip", "kit/index.php"),
                         b"<form>")
        blob = tar_blob([("kit/a.html", b"page", "file")])
        self.assertEqual(ftd.archive_member(blob, "k.tar.gz", "kit/a.html"), b"page")
        with self.assertRaises(KeyError):
            ftd.archive_member(blob, "k.tar.gz", "kit/absent.html")

    def test_oversized_member_refused(self):
        old = ftd.MAX_MEMBER_BYTES
        ftd.MAX_MEMBER_BYTES = 3
        try:
            blob = tar_blob([("big.html", b"too large", "file")])
            with self.assertRaises(IOError):
                ftd.archive_member(blob, "k.tar.gz", "big.html")
        finally:
            ftd.MAX_MEMBER_BYTES = old

    def test_safe_extract_keeps_inside(self):
        blob = tar_blob([("package/data/a.txt", b"ok", "file"),
                         ("../escape.txt", b"no", "file"),
                         ("/abs.txt", b"no", "file"),
                         ("package/link", b"", "link")])
        with tempfile.TemporaryDirectory() as d:
            inner = os.path.join(d, "inner")
            os.makedirs(inner)
            with tarfile.open(fileobj=io.BytesIO(blob)) as t:
                ftd.safe_extract(t, inner)
            found = sorted(os.path.relpath(os.path.join(r, f), d)
                           for r, _, fs in os.walk(d) for f in fs)
            self.assertEqual(found, [os.path.join("inner", "package", "data", "a.txt")])


class GroupTest(unittest.TestCase):
    def test_campaign_subjects_fold_together(self):
        a = ftd.mail_group(b"Subject: Invoice 1234 overdue\n\nbody one")
        b = ftd.mail_group(b"Subject: RE: invoice 99 OVERDUE\n\nbody two")
        c = ftd.mail_group(b"Subject: Meeting notes\n\nbody")
        self.assertEqual(a, b)
        self.assertNotEqual(a, c)
        self.assertTrue(ftd.mail_group(b"From: x\n\nno subject").startswith("b:"))

    def test_web_groups(self):
        kit = {"source": "github:o/r@1", "path": "kit.zip!a/b.php", "label": "phishing"}
        kit2 = dict(kit, path="kit.zip!c.php")
        site = {"source": "s", "path": "x.html", "label": "legit", "url": "https://www.Ex.com/a"}
        self.assertEqual(ftd.web_group(kit), ftd.web_group(kit2))
        self.assertEqual(ftd.web_group(site), "h:ex.com")


if __name__ == "__main__":
    unittest.main()
