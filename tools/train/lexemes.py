#!/usr/bin/python3
"""Learns the lexicon's weights (the first number of each lexdb.txt line) from the corpus.

Usage: lexemes.py --kb KBDIR --hits CHANNEL=HITS.jsonl ... --labels CHANNEL=CORPUS/CHANNEL.tsv ...
                  --corpus CORPUS [--seed N] [--prior FILE]
       lexemes.py --kb KBDIR --snapshot-prior [--prior FILE]

HITS is what `pelmix dump lexemes [--mail]` prints over a channel's corpus: per document, the
lexicon lines the engine's word finders matched. Only the documents of the train part (the
seeded split of the lists that train.py makes too) are counted, never calibration or test. Per line and channel, the document rates in phishing
and in each legitimate class give a log ratio (phishing against the legitimate class where
the line is most frequent), pooled over the channels by their evidence, shrunk towards the
value the curated weight stands for, and mapped back onto the weight scale. Every other
field, line and byte of lexdb.txt stays as it is; the same inputs give the same file.

The curated weights are kept in FILE (default tools/train/lexicon-prior.tsv: lexeme text, TAB,
weight), so that training again starts from them and not from its own last result. After the
generator of tools/kbdata/ has written a new lexdb.txt, `--snapshot-prior` records its weights
there; a line the file does not name has its present weight as prior.
"""
import argparse
import json
import math
import os
import re
import sys

sys.path.insert(0, os.path.dirname(os.path.abspath(__file__)))
import pelmix_train as pt  # noqa: E402
from train import read_labels  # noqa: E402

POSITIVE = "phishing"
# Weight scale: the weight of a line whose words are as frequent in phishing as in legitimate
# text, and the weight per nat of log ratio. 30 is the top of the engine's lowest weight band
# (up to 30; 31-65; 66 and more), so a line needs evidence for phishing to leave it.
NEUTRAL_WEIGHT = 30.0
WEIGHT_PER_NAT = 12.0
MIN_WEIGHT, MAX_WEIGHT = 1, 100
# Strength of the curated weight, in documents: a line seen in fewer documents than this
# keeps mostly its curated value.
PRIOR_DOCUMENTS = 20.0
# Additive smoothing of the per-class document rates.
RATE_PSEUDO = 0.5

LINE = re.compile(r"^(\S+)([ \t]+)(\d+)(.*)$", re.S)


def weight_to_ratio(w):
    return (float(w) - NEUTRAL_WEIGHT) / WEIGHT_PER_NAT


def ratio_to_weight(r):
    w = int(math.floor(NEUTRAL_WEIGHT + WEIGHT_PER_NAT * r + 0.5))
    return max(MIN_WEIGHT, min(MAX_WEIGHT, w))


def read_lexdb(path):
    """The file's lines (with their line ends) and {line number: curated weight} for every
    phrase or lexeme line (1-based numbers, as `pelmix dump lexemes` gives them)."""
    with open(path, "rb") as f:
        lines = f.read().decode("utf-8").splitlines(keepends=True)
    weights = {}
    for i, line in enumerate(lines, 1):
        if i == 1 and line.startswith("#"):
            continue
        body = line.rstrip("\r\n")
        if not body or body[0] in " \t":
            break  # the end of the lexemes for the engine's reader
        m = LINE.match(body)
        if m:
            weights[i] = int(m.group(3))
    return lines, weights


def write_lexdb(path, lines, new_weights):
    out = []
    for i, line in enumerate(lines, 1):
        if i in new_weights:
            end = line[len(line.rstrip("\r\n")):]
            m = LINE.match(line.rstrip("\r\n"))
            line = "%s%s%d%s%s" % (m.group(1), m.group(2), new_weights[i], m.group(4), end)
        out.append(line)
    with open(path, "wb") as f:
        f.write("".join(out).encode("utf-8"))


def line_text(line):
    return line.rstrip("\r\n").split(None, 1)[0] if line.strip() else ""


def read_prior(path):
    prior = {}
    with open(path, encoding="utf-8") as f:
        for line in f:
            text, _, w = line.rstrip("\n").rpartition("\t")
            if text:
                prior[text] = int(w)
    return prior


def write_prior(path, lines, weights):
    with open(path, "w", encoding="utf-8", newline="\n") as f:
        for i in sorted(weights):
            f.write("%s\t%d\n" % (line_text(lines[i - 1]), weights[i]))


def document_counts(docs):
    """docs: iterable of (label, set of line numbers). Returns ({label: documents},
    {label: {line: documents holding it}})."""
    totals, counts = {}, {}
    for label, lines in docs:
        totals[label] = totals.get(label, 0) + 1
        per = counts.setdefault(label, {})
        for ln in lines:
            per[ln] = per.get(ln, 0) + 1
    return totals, counts


def channel_ratio(line, totals, counts):
    """(log ratio, documents holding the line) of one channel, or None without both classes."""
    if totals.get(POSITIVE, 0) == 0:
        return None
    negatives = [lab for lab in sorted(totals) if lab != POSITIVE and totals[lab] > 0]
    if not negatives:
        return None

    def rate(lab):
        return (counts.get(lab, {}).get(line, 0) + RATE_PSEUDO) / (totals[lab] + 2 * RATE_PSEUDO)

    worst = max(rate(lab) for lab in negatives)
    seen = sum(counts.get(lab, {}).get(line, 0) for lab in totals)
    return math.log(rate(POSITIVE) / worst), seen


def learn_weights(curated, channels, prior=PRIOR_DOCUMENTS):
    """curated: {line: weight}; channels: list of (totals, counts) from document_counts.

    Returns {line: learned weight} for every curated line.
    """
    learned = {}
    for line in sorted(curated):
        num, seen_all = 0.0, 0
        for totals, counts in channels:
            got = channel_ratio(line, totals, counts)
            if got is None:
                continue
            ratio, seen = got
            num += seen * ratio
            seen_all += seen
        prior_ratio = weight_to_ratio(curated[line])
        posterior = (num + prior * prior_ratio) / (seen_all + prior)
        learned[line] = ratio_to_weight(posterior)
    return learned


def train_documents(hits_path, labels, seed, prefix):
    """(label, set of lines) of every readable train-part document of the hits file."""
    split = pt.split_files(labels, seed)
    docs = []
    with open(hits_path, encoding="utf-8") as f:
        for line in f:
            rec = json.loads(line)
            name = rec["file"]
            key = name[len(prefix):] if name.startswith(prefix) else name
            if key not in labels or split[key] != "train" or "error" in rec:
                continue
            docs.append((labels[key][0], set(rec["lines"])))
    return docs


def pairs(values):
    out = {}
    for v in values or []:
        k, _, path = v.partition("=")
        out[k] = path
    return out


def main():
    ap = argparse.ArgumentParser()
    ap.add_argument("--kb", required=True)
    ap.add_argument("--hits", action="append")
    ap.add_argument("--labels", action="append")
    ap.add_argument("--seed", type=int, default=pt.SEED)
    ap.add_argument("--corpus")
    ap.add_argument("--prior", default=os.path.join(os.path.dirname(os.path.abspath(__file__)),
                                                    "lexicon-prior.tsv"))
    ap.add_argument("--snapshot-prior", action="store_true")
    a = ap.parse_args()
    path = os.path.join(a.kb, "lexdb.txt")
    lines, present = read_lexdb(path)
    if a.snapshot_prior:
        write_prior(a.prior, lines, present)
        print("lexemes: %d curated weights recorded in %s" % (len(present), a.prior),
              file=sys.stderr)
        return 0
    if not (a.hits and a.labels and a.corpus):
        ap.error("--hits, --labels and --corpus are needed to learn")
    hits, labels = pairs(a.hits), pairs(a.labels)
    prefix = os.path.join(a.corpus, "")
    channels = []
    for ch in sorted(hits):
        docs = train_documents(hits[ch], read_labels(labels[ch]), a.seed, prefix)
        totals, counts = document_counts(docs)
        print("lexemes: %s: train documents %s" % (ch, json.dumps(totals, sort_keys=True)),
              file=sys.stderr)
        channels.append((totals, counts))
    prior = read_prior(a.prior)
    curated = {i: prior.get(line_text(lines[i - 1]), w) for i, w in present.items()}
    learned = learn_weights(curated, channels)
    changed = sum(1 for k in curated if learned[k] != curated[k])
    write_lexdb(path, lines, learned)
    print("lexemes: %d lines, %d weights changed" % (len(curated), changed), file=sys.stderr)
    return 0


if __name__ == "__main__":
    sys.exit(main())
