#!/usr/bin/python3
"""Fits one channel's decision model and writes it into a knowledge-base folder.

Usage: train.py --channel mail|web --vectors V.jsonl --labels CORPUS/mail.tsv
                --corpus CORPUS --kb KBDIR [--report R.json] [--seed N]

The labelled groups are split (seeded) into train, calibration and test parts; the model is
fitted on train, the thresholds are chosen on calibration for the false-positive budgets,
and the test part is left untouched for scripts/evaluate (its files are listed in the
report). Writes KBDIR/CHANNEL.flow, .rules, .net and the CHANNEL_threshold and
CHANNEL_threshold_loud lines of KBDIR/v3.cfg.
"""
import argparse
import json
import os
import re
import sys

import numpy as np

sys.path.insert(0, os.path.dirname(os.path.abspath(__file__)))
import pelmix_train as pt  # noqa: E402

POSITIVE = "phishing"


def read_labels(path):
    labels = {}
    with open(path, encoding="utf-8") as f:
        head = f.readline().rstrip("\n").split("\t")
        fi, li, gi = head.index("file"), head.index("label"), head.index("group")
        for line in f:
            c = line.rstrip("\n").split("\t")
            labels[c[fi]] = (c[li], c[gi])
    return labels


def set_cfg(path, values):
    """Replaces or appends `key=value;` lines, keeping every other line as it is."""
    text = ""
    if os.path.exists(path):
        with open(path, encoding="utf-8") as f:
            text = f.read()
    for key, val in values.items():
        line = "%s=%s;" % (key, val)
        pat = re.compile(r"^%s=[^\n]*$" % re.escape(key), re.M)
        if pat.search(text):
            text = pat.sub(line, text)
        else:
            if text and not text.endswith("\n"):
                text += "\n"
            text += line + "\n"
    with open(path, "w", encoding="utf-8") as f:
        f.write(text)


def write_exact(path, text):
    with open(path, "w", encoding="utf-8", newline="") as f:
        f.write(text)


def train(channel, X, labels, groups, trusted, seed):
    y = np.array([lab == POSITIVE for lab in labels])
    part = pt.group_split(groups, labels, seed=seed)
    fit = (part == "train") & ~trusted
    rules = pt.fit_rules(X[fit])
    E = pt.encode_rules(X, rules)
    W, b = pt.fit_network(E[fit], y[fit], seed=seed)
    outs = pt.net_outputs(E, W, b)
    r = pt.radius(outs)
    r[trusted] = np.inf  # the engine never judges a trusted page
    cal = part == "calib"
    thr, loud = None, None
    for cls, (quiet_budget, loud_budget) in pt.BUDGETS[channel].items():
        neg = cal & (np.array(labels) == cls)
        if not neg.any():
            continue
        t = pt.choose_threshold(r[neg], quiet_budget)
        lt = pt.choose_threshold(r[neg], loud_budget)
        thr = t if thr is None else min(thr, t)
        loud = lt if loud is None else min(loud, lt)
    if thr is None:
        raise ValueError("no negative samples in the calibration part")
    return rules, W, b, outs, r, part, thr, min(loud, thr)


def main():
    ap = argparse.ArgumentParser()
    ap.add_argument("--channel", choices=sorted(pt.VECTOR_SIZE), required=True)
    ap.add_argument("--vectors", required=True)
    ap.add_argument("--labels", required=True)
    ap.add_argument("--corpus", required=True, help="folder the labels' file names are in")
    ap.add_argument("--kb", required=True)
    ap.add_argument("--report")
    ap.add_argument("--seed", type=int, default=pt.SEED)
    a = ap.parse_args()
    labels = read_labels(a.labels)
    prefix = os.path.join(a.corpus, "")
    X, lab, grp, files, trusted = pt.load_vectors(a.vectors, labels, prefix)
    if X.shape[1] != pt.VECTOR_SIZE[a.channel]:
        sys.exit("train: %s vectors hold %d values, the model needs %d"
                 % (a.channel, X.shape[1], pt.VECTOR_SIZE[a.channel]))
    rules, W, b, outs, r, part, thr, loud = train(a.channel, X, lab, grp, trusted, a.seed)
    write_exact(os.path.join(a.kb, a.channel + ".rules"), pt.format_rules(rules))
    write_exact(os.path.join(a.kb, a.channel + ".net"), pt.format_network(W, b))
    write_exact(os.path.join(a.kb, a.channel + ".flow"), pt.format_flow(a.channel))
    set_cfg(os.path.join(a.kb, "v3.cfg"), {
        a.channel + "_threshold": "%.9g" % thr,
        a.channel + "_threshold_loud": "%.9g" % loud,
    })
    counts = {}
    for p, l in zip(part, lab):
        counts.setdefault(p, {}).setdefault(l, 0)
        counts[p][l] += 1
    print("train: %s: %d vectors, %d encoded inputs, threshold %.6g, loud %.6g, parts %s"
          % (a.channel, len(lab), W.shape[1], thr, loud, json.dumps(counts, sort_keys=True)),
          file=sys.stderr)
    if a.report:
        with open(a.report, "w", encoding="utf-8") as f:
            json.dump({"channel": a.channel, "seed": a.seed, "threshold": thr,
                       "threshold_loud": loud, "parts": counts,
                       "test": [fn for fn, p in zip(files, part) if p == "test"],
                       "calib": [fn for fn, p in zip(files, part) if p == "calib"]},
                      f, indent=1, sort_keys=True)
    return 0


if __name__ == "__main__":
    sys.exit(main())
