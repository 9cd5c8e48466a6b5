#!/usr/bin/env python3
"""What each test of one program reaches, from the coverage build (scripts/coverage.sh).

usage: scripts/coverage-by-test.py PROGRAM [--filter GTEST_FILTER]
Runs each test of PROGRAM alone (under xvfb-run when DISPLAY is unset), collects the lines and
branches of the program's code (app graphics fileio videointerface utils services versioncheck
tools) that it reaches, and prints, per test: lines reached, lines that NO OTHER test of this
program reaches ("unique"), and the same for branches. A test with 0 unique lines and branches
adds no coverage on its own (it may still check values other tests do not).
BUILD_DIR names the coverage build (default build-coverage); build the program there first
(cmake --build build-coverage --target PROGRAM). Each test writes its counts under a folder of
its own (GCOV_PREFIX), so the build's own counts are left alone.
"""
import json, os, re, shutil, subprocess, sys, tempfile
ROOT = os.path.dirname(os.path.dirname(os.path.abspath(__file__)))
BUILD = os.path.join(ROOT, os.environ.get("BUILD_DIR", "build-coverage"))
CODE = re.compile(r"^" + re.escape(ROOT) + r"/(app|graphics|fileio|videointerface|utils|services|versioncheck|tools)/")
prog = sys.argv[1]
gfilter = "*"
if "--filter" in sys.argv:
    gfilter = sys.argv[sys.argv.index("--filter") + 1]
exe = os.path.join(BUILD, "tests", prog)
names = []
suite = None
for line in subprocess.run([exe, "--gtest_list_tests", "--gtest_filter=" + gfilter], capture_output=True, text=True).stdout.splitlines():
    if not line.strip() or line.startswith("Running main"):
        continue
    if not line.startswith(" "):
        suite = line.split()[0]
    else:
        names.append(suite + line.split()[0])
scratch = tempfile.mkdtemp(prefix="testcov-")
env = dict(os.environ)
for k in ("XDG_RUNTIME_DIR", "XDG_CONFIG_HOME", "XDG_CACHE_HOME"):
    d = os.path.join(scratch, k)
    os.makedirs(d, mode=0o700)
    env[k] = d
results = {}
for i, name in enumerate(names):
    prefix = os.path.join(scratch, "t%d" % i)
    env["GCOV_PREFIX"] = prefix
    env["GCOV_PREFIX_STRIP"] = "0"
    cmd = [exe, "--gtest_filter=" + name]
    if not os.environ.get("DISPLAY"):
        cmd = ["xvfb-run", "-a", "-s", "-screen 0 1920x1080x24 -nolisten tcp -noreset"] + cmd
    r = subprocess.run(cmd, env=env, cwd=os.path.dirname(exe), capture_output=True, text=True)
    if r.returncode != 0:
        print("FAILED:", name, file=sys.stderr)
    lines, branches = set(), set()
    for dirpath, _, files in os.walk(prefix):
        for f in files:
            if not f.endswith(".gcda"):
                continue
            real = dirpath[len(prefix):]
            if real.startswith(os.path.join(BUILD, "tests") + "/"):
                continue
            gcno = os.path.join(real, f[:-5] + ".gcno")
            if not os.path.exists(gcno):
                continue
            shutil.copy(gcno, dirpath)
            out = subprocess.run(["gcov", "--json-format", "--stdout", "-b", "-o", dirpath, os.path.join(dirpath, f)],
                                 capture_output=True, text=True, cwd=dirpath).stdout
            for doc in out.splitlines():
                doc = doc.strip()
                if not doc.startswith("{"):
                    continue
                data = json.loads(doc)
                for fe in data.get("files", []):
                    src = fe["file"]
                    if not src.startswith("/"):
                        src = os.path.normpath(os.path.join(data.get("current_working_directory", ""), src))
                    if not CODE.match(src):
                        continue
                    rel = src[len(ROOT) + 1:]
                    for ln in fe["lines"]:
                        if ln["count"] > 0:
                            lines.add((rel, ln["line_number"]))
                        for bi, b in enumerate(ln.get("branches", [])):
                            if b["count"] > 0 and not b.get("throw"):
                                branches.add((rel, ln["line_number"], bi))
    results[name] = (lines, branches)
    shutil.rmtree(prefix, ignore_errors=True)
shutil.rmtree(scratch, ignore_errors=True)
from collections import Counter
lc, bc = Counter(), Counter()
for l, b in results.values():
    lc.update(l); bc.update(b)
print(f"{'test':90} {'lines':>6} {'uniqL':>6} {'branch':>6} {'uniqB':>6}")
for name, (l, b) in sorted(results.items(), key=lambda kv: (sum(1 for x in kv[1][0] if lc[x] == 1) + sum(1 for x in kv[1][1] if bc[x] == 1))):
    ul = [x for x in l if lc[x] == 1]
    ub = [x for x in b if bc[x] == 1]
    files = sorted(set(x[0] for x in ul + ub))
    print(f"{name[:90]:90} {len(l):6} {len(ul):6} {len(b):6} {len(ub):6}  {' '.join(files)[:150]}")
print(f"program union: {len(lc)} lines, {len(bc)} branches")
