#!/usr/bin/python3
"""Fits one channel's decision model and writes it into a knowledge-base folder.

Usage: train.py --channel mail|web --vectors V.jsonl --labels CORPUS/mail.tsv
                --corpus CORPUS --kb KBDIR [--report R.json] [--seed N]

The labelled groups are split (seeded) into train, calibration and test parts. The
thresholds are chosen for the false-positive budgets on the radii that the train and
calibration samples get in a group-wise cross-validation (a model fitted without their fold),
then the model is fitted on both parts; the test part is left untouched for scripts/evaluate
(its files are listed in the report). Writes KBDIR/CHANNEL.flow, .rules, .net and the CHANNEL_threshold and
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
# Folds of the cross-validation that places the thresholds.
CV_FOLDS = 5


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


def fit(X, labels, rows, seed, quantiles=pt.LEVEL_QUANTILES):
    """Rules levels and network fitted on the given rows."""
    rules = pt.fit_rules(X[rows], quantiles)
    E = pt.encode_rules(X[rows], rules)
    y = np.array([lab == POSITIVE for lab in labels])[rows]
    W, b = pt.fit_network(E, y, seed=seed,
                          weights=pt.sample_weights(np.asarray(labels, dtype=object)[rows]))
    return rules, W, b


def radii(X, model, trusted):
    rules, W, b = model
    r = pt.radius(pt.net_outputs(pt.encode_rules(X, rules), W, b))
    r[trusted] = np.inf  # the engine never judges a trusted page
    return r


def fold_of(groups, folds, seed):
    """Group -> fold number, seeded: near-duplicates stay in one fold."""
    gs = sorted(set(groups))
    rng = np.random.RandomState(seed + 1)
    rng.shuffle(gs)
    where = {g: i % folds for i, g in enumerate(gs)}
    return np.array([where[g] for g in groups])


def train(channel, X, labels, groups, trusted, part, seed, fit_X=None):
    """Fits on the train and calibration parts; the thresholds come from the radii the
    samples of those parts get from models fitted without their fold (cross-validation).

    fit_X, when given, holds the vectors the model is fitted on (same rows as X); X holds
    what the engine sees, on which the thresholds are chosen.
    """
    fit_X = X if fit_X is None else fit_X
    quantiles = pt.CHANNEL_QUANTILES[channel]
    labels_arr = np.array(labels, dtype=object)
    dev = ((part == "train") | (part == "calib")) & ~trusted
    fold = fold_of(groups, CV_FOLDS, seed)
    oof = np.full(len(labels), np.inf, dtype=np.float32)
    for k in range(CV_FOLDS):
        model = fit(fit_X, labels, dev & (fold != k), seed, quantiles)
        held = dev & (fold == k)
        oof[held] = radii(X[held], model, trusted[held])
    thr, loud = None, None
    for cls, (quiet_budget, loud_budget) in pt.BUDGETS[channel].items():
        neg = dev & (labels_arr == cls)
        if not neg.any():
            continue
        t = pt.choose_threshold(oof[neg], quiet_budget)
        lt = pt.choose_threshold(oof[neg], loud_budget)
        thr = t if thr is None else min(thr, t)
        loud = lt if loud is None else min(loud, lt)
    if thr is None:
        raise ValueError("no negative samples to choose a threshold on")
    pos = dev & (labels_arr == POSITIVE)
    cv_recall = float(np.mean(oof[pos] <= thr)) if pos.any() else float("nan")
    rules, W, b = fit(fit_X, labels, dev, seed, quantiles)
    return rules, W, b, thr, min(loud, thr), cv_recall


def main():
    ap = argparse.ArgumentParser()
    ap.add_argument("--channel", choices=sorted(pt.VECTOR_SIZE), required=True)
    ap.add_argument("--vectors", required=True)
    ap.add_argument("--labels", required=True)
    ap.add_argument("--corpus", required=True, help="folder the labels' file names are in")
    ap.add_argument("--kb", required=True)
    ap.add_argument("--report")
    ap.add_argument("--seed", type=int, default=pt.SEED)
    ap.add_argument("--fit-vectors", help="vectors to fit on instead (same files): e.g. the "
                    "pages scanned without their URL")
    a = ap.parse_args()
    labels = read_labels(a.labels)
    prefix = os.path.join(a.corpus, "")
    X, lab, grp, files, trusted = pt.load_vectors(a.vectors, labels, prefix)
    if X.shape[1] != pt.VECTOR_SIZE[a.channel]:
        sys.exit("train: %s vectors hold %d values, the model needs %d"
                 % (a.channel, X.shape[1], pt.VECTOR_SIZE[a.channel]))
    split = pt.split_files(labels, a.seed)
    part = np.array([split[f] for f in files], dtype=object)
    fit_X = None
    if a.fit_vectors:
        FX, _, _, ffiles, ftrusted = pt.load_vectors(a.fit_vectors, labels, prefix)
        where = {f: i for i, f in enumerate(ffiles)}
        fit_X = np.zeros_like(X)
        for i, f in enumerate(files):
            if f not in where:
                sys.exit("train: %s has no vector in %s" % (f, a.fit_vectors))
            fit_X[i] = FX[where[f]]
            trusted[i] = trusted[i] or ftrusted[where[f]]
    rules, W, b, thr, loud, cv_recall = train(a.channel, X, lab, grp, trusted, part, a.seed,
                                              fit_X)
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
    print("train: %s: %d vectors, %d encoded inputs, threshold %.6g, loud %.6g, "
          "cross-validated recall %.4f, parts %s"
          % (a.channel, len(lab), W.shape[1], thr, loud, cv_recall,
             json.dumps(counts, sort_keys=True)), file=sys.stderr)
    if a.report:
        with open(a.report, "w", encoding="utf-8") as f:
            json.dump({"channel": a.channel, "seed": a.seed, "threshold": thr,
                       "threshold_loud": loud, "parts": counts, "cv_recall": cv_recall,
                       "test": [fn for fn, p in zip(files, part) if p == "test"],
                       "calib": [fn for fn, p in zip(files, part) if p == "calib"]},
                      f, indent=1, sort_keys=True)
    return 0


if __name__ == "__main__":
    sys.exit(main())
