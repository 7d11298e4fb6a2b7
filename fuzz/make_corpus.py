#!/usr/bin/env python3
"""Writes the committed seed corpora of the libFuzzer harnesses under fuzz/corpus/.

Usage: fuzz/make_corpus.py PELMIX_CLI [OUT_DIR]

Every seed is written by this script (pages, PDFs, model files) or made by the CLI's own
knowledge-base writers from examples/kb (containers and knowledge-base entries), so the
corpus can be rebuilt when a format changes. Inputs a fuzzer found that once crashed are
added by hand under fuzz/corpus/<target>/ and are not touched here.
"""
import os
import subprocess
import sys
import tempfile
import zlib

HERE = os.path.dirname(os.path.abspath(__file__))
ROOT = os.path.dirname(HERE)

# The harnesses that cut their input take the piece size from the first byte (1 + b % 13).
PIECE = b"7"

PAGES = {
    "login_form.html": b"""<!DOCTYPE html>
<html><head><title>Sign in - Example Bank</title>
<meta name="description" content="Online banking &amp; accounts">
<link rel="icon" href="/favicon.ico"></head>
<body><h1>Verify your account</h1>
<form action="https://collect.example.net/post.php" method="post">
<input type="email" name="login" placeholder="E-mail">
<input type="password" name="pass"><select name="q"><option>Mother's name</option></select>
<input type="submit" value="Log in"></form>
<a href="https://www.examplebank.com/help">Help</a> <a href='/privacy'>Privacy</a>
<img src="logo.png" alt="logo"><!-- copy of the real page --></body></html>
""",
    "script_write.html": b"""<html><body><script type="text/javascript">
var s = "<a href='http://a.example/x'>x</a>";
document.write(unescape("%3Cform%20action%3D%22http%3A//b.example/%22%3E"));
document.write('<input type="password">' + s);
eval("window.location='http://c.example/?q=1'");
var u = atob("PGEgaHJlZj0iaHR0cDovL2QuZXhhbXBsZS8iPg==");
document.writeln(String.fromCharCode(60, 98, 62));
</script><noscript>enable scripts</noscript></body></html>
""",
    "meta_refresh.html": b"""<html><head>
<meta http-equiv="refresh" content="0; url=data:text/html;base64,PGh0bWw+PHRpdGxlPk5lc3RlZDwvdGl0bGU+PGZvcm0+PGlucHV0IHR5cGU9cGFzc3dvcmQ+PC9mb3JtPjwvaHRtbD4=">
<meta http-equiv="Refresh" content="5;URL='http://next.example/page'">
</head><body>Redirecting&hellip;</body></html>
""",
    "nested_frames.html": b"""<html><body>
<iframe src="data:text/html,%3Ch1%3EInner%3C%2Fh1%3E%3Ca%20href%3D%22http%3A%2F%2Fe.example%22%3E"></iframe>
<iframe srcdoc="&lt;p&gt;doc&lt;/p&gt;"></iframe>
<object data="data:text/html;charset=utf-8,<b>obj</b>"></object>
<embed src="http://f.example/flash.swf"><frame src="menu.html">
<a href="javascript:void(0)" onclick="location.href='http://g.example/'">go</a>
</body></html>
""",
    "entities_text.html": b"""<p>&lt;Caf&eacute; &#233; &#xE9; &#x1F600; &amp;amp &copy&nbsp;
&NotANamedEntity; &#0; &#x110000; &#xD800;</p><pre>  spaced
 text</pre><textarea><b>not a tag</b></textarea><plaintext>rest <is> text
""",
    "broken_markup.html": b"""<<a href=x>><div class="a" id='b' data-x=c d>text</DIV
<scr<script>ipt>alert(1)</script><!-- unterminated <![CDATA[ x ]]> <? pi ?>
<a href="http://h.example/"" title='t'>t</a><br/><input value=">">
</style></title><title>two<title>three</title></html>""",
    "json_page.json": b"""{"status": "ok", "items": [1, 2.5e3, -0.1, true, false, null],
"nested": {"a": "\\u0041\\n", "b": [{"c": {}}]}, "html": "<a href=\\"http://i.example\\">"}
""",
    "json_prefix.html": b"""[{"x": 1}, "<form><input type=password></form>"]""",
    "empty.html": b"",
    "utf8_mixed.html": "<html lang=ru><title>Вход в аккаунт</title><p>Пароль: <input type=password>"
    "<p>Konto bestätigen · 口座確認</p>".encode("utf-8")
    + b"\xff\xfe\xc3(\xe2\x82",
}


def pdf_file(objects):
    """A PDF with a header, the given object bodies, an xref table and a trailer."""
    out = bytearray(b"%PDF-1.4\n%\xe2\xe3\xcf\xd3\n")
    offsets = []
    for number, body in enumerate(objects, start=1):
        offsets.append(len(out))
        out += b"%d 0 obj\n" % number + body + b"\nendobj\n"
    xref = len(out)
    out += b"xref\n0 %d\n0000000000 65535 f \n" % (len(objects) + 1)
    for offset in offsets:
        out += b"%010d 00000 n \n" % offset
    out += b"trailer\n<< /Size %d /Root 1 0 R >>\nstartxref\n%d\n%%%%EOF\n" % (
        len(objects) + 1, xref)
    return bytes(out)


def stream(dictionary, data):
    return b"<< " + dictionary + b" /Length %d >>\nstream\r\n" % len(data) + data + b"\nendstream"


CONTENT = b"""BT
/F1 12 Tf 72 712 Td
(Your account has been suspended) Tj
0 -14 Td
[(Verify ) -250 (your \\(identity\\)) ( now)] TJ
(Login at https://j.example/verify) '
ET
"""

PDFS = {
    "text_flate.pdf": pdf_file([
        b"<< /Type /Catalog /Pages 2 0 R >>",
        b"<< /Type /Pages /Kids [3 0 R] /Count 1 >>",
        b"<< /Type /Page /Parent 2 0 R /Contents 4 0 R /Annots [5 0 R] >>",
        stream(b"/Filter /FlateDecode", zlib.compress(CONTENT)),
        b"<< /Type /Annot /Subtype /Link /Rect [0 0 100 20] "
        b"/A << /S /URI /URI (https://k.example/login?id=1) >> >>",
    ]),
    "plain_stream.pdf": pdf_file([
        b"<< /Type /Catalog /Pages 2 0 R >>",
        stream(b"", CONTENT),
        b"<< /S /URI /URI 4 0 R >> (http://l.example/ref)",
        b"(http://l.example/elsewhere)",
    ]),
    "image_and_objstm.pdf": pdf_file([
        stream(b"/Type /XObject /Subtype /Image /Width 2 /Height 1 /BitsPerComponent 8 "
               b"/Filter /FlateDecode", zlib.compress(b"\x00\xff\x10\x20\x30\x40")),
        stream(b"/Type /ObjStm /N 1 /First 4 /Filter /FlateDecode",
               zlib.compress(b"6 0 << /URI (http://m.example/in-objstm) >>")),
        b"<< /Subtype/Image>> stream\nnot an image\nendstream",
    ]),
    "truncated.pdf": pdf_file([
        stream(b"/Filter /FlateDecode", zlib.compress(CONTENT * 3)),
    ])[:200],
}

# Flow, rules and network files joined by NUL bytes, as the model harness splits them.
MODELS = {
    "boost_only": b'{"convs":{"s":{"type":"sqrtboost"}},"flow":[{"name":"a","input":[[0,4]],'
                  b'"conv":"s"}]}',
    "rules_net": b'{"convs":{"r":{"type":"rules","src":"r"},"n":{"type":"neur","src":"n"},'
                 b'"s":{"type":"sqrtboost"}},"flow":[{"name":"enc","input":[[0,4]],"conv":"r"},'
                 b'{"name":"net","input":["enc"],"conv":"n"},'
                 b'{"name":"out","input":["net",[4,6]],"conv":"s"}]}'
                 b"\x002 0.5 1 2 0.5 1 2 0.5 1 2 0.5 1"
                 b"\x001 9 2 -4 0.5 2 0.5 2 1 1 1 1 -4 0.5 2 0.5 2 0.25 0.5 0.25 0.5",
    "two_layers": b'{"convs":{"n":{"type":"neur","src":"n"}},"flow":[{"name":"x","input":'
                  b'[[0,2],[10,12]],"conv":"n"},{"name":"y","input":["x","x"]}]}'
                  b"\x00\x002 4 3 2 0.1 0.2 0.3 0.4 -1 1 0.5 0.5 0.5 0.5 0.5 0.5 0 0 "
                  b"0.1 0.2 0.3 0.4 0.5 0.6 1 1",
    "empty_flow": b'{"convs":{},"flow":[]}\x00\x00',
}

# The entry reader the kb harness picks is its first byte modulo 5.
KB_READERS = {"wdb": b"2", "sb.db": b"3", "orgs": b"4", "lexdb.txt": b"0",
              "share_links.txt": b"1"}


def write(path, data):
    os.makedirs(os.path.dirname(path), exist_ok=True)
    with open(path, "wb") as out:
        out.write(data)


def run(*args):
    return subprocess.run(args, check=True, stdout=subprocess.PIPE).stdout


def main():
    if len(sys.argv) not in (2, 3):
        sys.exit(__doc__)
    cli = sys.argv[1]
    out = sys.argv[2] if len(sys.argv) == 3 else os.path.join(HERE, "corpus")

    for name, page in PAGES.items():
        write(os.path.join(out, "decrunch_fuzz", name), PIECE + page)
    for name, pdf in PDFS.items():
        write(os.path.join(out, "pdf_scan_fuzz", name), PIECE + pdf)
    for name, model in MODELS.items():
        write(os.path.join(out, "deep_solver_fuzz", name), model)
    # The mail walk starts from the hand-made test messages (one mbox among them).
    mail = os.path.join(ROOT, "tests", "data", "mail")
    for name in sorted(os.listdir(mail)):
        with open(os.path.join(mail, name), "rb") as f:
            write(os.path.join(out, "mail_walk_fuzz", name.replace(".", "_")), PIECE + f.read())

    with tempfile.TemporaryDirectory() as work:
        example = os.path.join(work, "example.kb")
        run(cli, "kb", "build", os.path.join(ROOT, "examples", "kb"), example)
        with open(example, "rb") as f:
            container = f.read()
        # The harness repairs the checksums when the marker byte asks (bits 0 and 1), so
        # mutations of the repaired copy reach the structure behind them.
        write(os.path.join(out, "packed_file_fuzz", "example.kb"), container)
        write(os.path.join(out, "packed_file_fuzz", "example_repaired.kb"),
              bytes([container[0] | 3]) + container[1:])
        small = os.path.join(work, "small.kb")
        run(cli, "kb", "pack", small, "v3.cfg=" + os.path.join(ROOT, "examples", "kb", "v3.cfg"))
        with open(small, "rb") as f:
            write(os.path.join(out, "packed_file_fuzz", "config_only.kb"), f.read())
        for entry, selector in KB_READERS.items():
            data = run(cli, "kb", "cat", example, entry)
            write(os.path.join(out, "kb_bases_fuzz", entry.replace(".", "_")), selector + data)


if __name__ == "__main__":
    main()
