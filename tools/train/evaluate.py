#!/usr/bin/python3
"""Measures a knowledge base on the held-out part of a labelled corpus.

Usage: evaluate.py --channel mail|web --corpus CORPUS --report TRAIN_REPORT.json
                   --kb KBFILE --pelmix BIN [--part test] [--png ROC.png] [--json OUT.json]

Runs the part's files through the module (`pelmix mail` or `pelmix scan`, --json
--features): recall and false-positive rates come from the module's own verdicts; the ROC
curves and their areas from the model's radius, recomputed by `pelmix model run` on the
same vectors. Intervals are 95% bootstrap percentiles.
"""
import argparse
import json
import os
import subprocess
import sys
import tempfile

import numpy as np

sys.path.insert(0, os.path.dirname(os.path.abspath(__file__)))
import pelmix_train as pt  # noqa: E402
from train import read_labels  # noqa: E402

POSITIVE = "phishing"
BOOTSTRAP_REPS = 1000


def run_module(a, files, labels):
    paths = [os.path.join(a.corpus, f) for f in files]
    if a.channel == "mail":
        cmd = [a.pelmix, "mail", "--kb", a.kb, "--json", "--features", "--jobs", "2"] + paths
        out = subprocess.run(cmd, capture_output=True, text=True).stdout
    else:
        with tempfile.NamedTemporaryFile("w", suffix=".tsv", delete=False) as t:
            for f, p in zip(files, paths):
                t.write("%s\t%s\n" % (p, labels[f][2]))
        cmd = [a.pelmix, "scan", "--kb", a.kb, "--json", "--features", "--jobs", "2",
               "--list", t.name]
        out = subprocess.run(cmd, capture_output=True, text=True).stdout
        os.unlink(t.name)
    recs = {}
    prefix = os.path.join(a.corpus, "")
    for line in out.splitlines():
        r = json.loads(line)
        key = r["file"][len(prefix):]
        if key.endswith("#1"):
            key = key[:-2]  # a message starting with "From " is read as an mbox of one
        recs.setdefault(key, r)
    return recs


def radii(a, vectors):
    """The engine's radius per vector (inf where it would not detect), from `model run`."""
    feed = "".join(" ".join(repr(float(v)) for v in vec) + "\n" for vec in vectors)
    out = subprocess.run([a.pelmix, "model", "run", "--kb", a.kb, a.channel + ".flow",
                          "--threshold", "2"], input=feed, capture_output=True, text=True,
                         check=True).stdout
    outs = np.array([[float(v) for v in line.split("\t")[0].split()]
                     for line in out.splitlines()], dtype=np.float32)
    return pt.radius(outs)


def rate(flags, idx):
    return float(np.mean(flags[idx])) if len(idx) else float("nan")


def main():
    ap = argparse.ArgumentParser()
    ap.add_argument("--channel", choices=sorted(pt.VECTOR_SIZE), required=True)
    ap.add_argument("--corpus", required=True)
    ap.add_argument("--report", required=True)
    ap.add_argument("--kb", required=True)
    ap.add_argument("--pelmix", required=True)
    ap.add_argument("--part", default="test", choices=("test", "calib"))
    ap.add_argument("--png")
    ap.add_argument("--json")
    a = ap.parse_args()
    with open(a.report, encoding="utf-8") as f:
        rep = json.load(f)
    table = read_labels(os.path.join(a.corpus, a.channel + ".tsv"))
    urls = {}
    with open(os.path.join(a.corpus, a.channel + ".tsv"), encoding="utf-8") as f:
        f.readline()
        for line in f:
            c = line.rstrip("\n").split("\t")
            urls[c[0]] = c[2]
    labels = {k: (v[0], v[1], urls.get(k, "")) for k, v in table.items()}
    files = rep[a.part]
    recs = run_module(a, files, labels)
    files = [f for f in files if f in recs and "error" not in recs[f]]
    lab = np.array([labels[f][0] for f in files])
    flagged = np.array([bool(recs[f]["phishing"]) for f in files])
    has_vec = [recs[f].get("features") is not None for f in files]
    r = np.full(len(files), np.inf, dtype=np.float32)
    vecs = [recs[f]["features"] for f, h in zip(files, has_vec) if h]
    if vecs:
        r[np.array(has_vec)] = radii(a, vecs)
    # A score that grows towards phishing: minus the radius, undetectable ones last.
    score = np.where(np.isfinite(r), -r, -10.0)
    pos = np.where(lab == POSITIVE)[0]
    result = {"channel": a.channel, "part": a.part, "kb": os.path.basename(a.kb),
              "counts": {c: int((lab == c).sum()) for c in sorted(set(lab))}}
    result["recall"] = rate(flagged, pos)
    result["recall_ci"] = pt.bootstrap_ci(lambda i: rate(flagged[pos], i), len(pos),
                                          BOOTSTRAP_REPS)
    result["fp_rate"], result["fp_ci"], result["auc"], result["auc_ci"] = {}, {}, {}, {}
    curves = {}
    for cls in sorted(set(lab) - {POSITIVE}):
        neg = np.where(lab == cls)[0]
        result["fp_rate"][cls] = rate(flagged, neg)
        result["fp_ci"][cls] = pt.bootstrap_ci(lambda i: rate(flagged[neg], i), len(neg),
                                               BOOTSTRAP_REPS)
        both = np.concatenate([pos, neg])
        yb = lab[both] == POSITIVE
        sb = score[both]
        result["auc"][cls] = pt.roc_auc(sb, yb)
        result["auc_ci"][cls] = pt.bootstrap_ci(lambda i: pt.roc_auc(sb[i], yb[i]), len(both),
                                                BOOTSTRAP_REPS)
        curves[cls] = roc_points(sb, yb)
    text = json.dumps(result, indent=1, sort_keys=True)
    print(text)
    if a.json:
        with open(a.json, "w", encoding="utf-8") as f:
            f.write(text + "\n")
    if a.png:
        draw(a.png, a.channel, curves, result)
    return 0


def roc_points(score, y):
    order = np.argsort(-score, kind="mergesort")
    ys = y[order]
    tp = np.concatenate([[0], np.cumsum(ys)]) / max(1, ys.sum())
    fp = np.concatenate([[0], np.cumsum(~ys)]) / max(1, (~ys).sum())
    return fp, tp


def draw(path, channel, curves, result):
    import matplotlib

    matplotlib.use("Agg")
    import matplotlib.pyplot as plt

    fig, ax = plt.subplots(figsize=(5, 5), dpi=100)
    for cls, (fp, tp) in curves.items():
        lo, hi = result["auc_ci"][cls]
        ax.plot(fp, tp, label="%s: AUC %.3f [%.3f, %.3f]" % (cls, result["auc"][cls], lo, hi))
    ax.plot([0, 1], [0, 1], ":", color="grey")
    ax.set_xscale("symlog", linthresh=0.01)
    ax.set_xlim(0, 1)
    ax.set_ylim(0, 1.01)
    ax.set_xlabel("false-positive rate")
    ax.set_ylabel("phishing detected")
    ax.set_title("pelmix %s, held-out part" % channel)
    ax.legend(loc="lower right", fontsize=8)
    fig.tight_layout()
    fig.savefig(path, metadata={"Software": None})
    plt.close(fig)


if __name__ == "__main__":
    sys.exit(main())
