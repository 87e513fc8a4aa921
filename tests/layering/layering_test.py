#!/usr/bin/env python3
"""The layout holds: each subsystem includes only itself and the subsystems below it, the
interface folders include nothing of the implementation, no internal or POSIX header is
reachable from an installed header, and every test source is in a program ctest runs."""
import argparse, pathlib, re, subprocess, sys

INCLUDE = re.compile(r'^\s*#\s*include\s+"([^"]+)"', re.M)
INTERFACES = ["public", "streams", "filesys"]
INSTALLED = ["include/ZYRStd.h", "hostkit/ZYRHostKit.h"]


def includes(path):
    return INCLUDE.findall(path.read_text(errors="replace"))


def main():
    ap = argparse.ArgumentParser()
    ap.add_argument("--source", required=True)
    ap.add_argument("--build", required=True)
    ap.add_argument("--compiler", required=True)
    ap.add_argument("--subsystems", required=True)
    a = ap.parse_args()
    top = pathlib.Path(a.source)
    lib = top / "source/zyr/std"
    order = a.subsystems.split()
    rank = {name: i for i, name in enumerate(order)}
    faults = []

    # Every folder of the library is a listed subsystem, and includes none above it.
    for folder in sorted(p for p in lib.iterdir() if p.is_dir()):
        if folder.name not in rank:
            faults.append(f"{folder.relative_to(top)} is not a listed subsystem")
    for path in sorted(lib.rglob("*")):
        if path.suffix not in (".h", ".cpp", ".def") or path.parts[-2] == "CMakeLists.txt":
            continue
        own = path.relative_to(lib).parts[0]
        for name in includes(path):
            m = re.match(r"zyr/std/([^/]+)/", name)
            if name.startswith("zyr/std/") and not m:
                faults.append(f"{path.relative_to(top)} includes {name}, outside any subsystem")
            elif m and rank.get(m.group(1), -1) > rank.get(own, -1):
                faults.append(f"{path.relative_to(top)} ({own}) includes {name} from a higher subsystem")

    # The interface folders stand above the implementation.
    for folder in INTERFACES:
        for path in sorted((top / folder).rglob("*")):
            for name in includes(path) if path.is_file() else []:
                if name.startswith("zyr/") or not (top / folder / name).exists() and not any(
                        (top / f / name).exists() for f in INTERFACES):
                    faults.append(f"{path.relative_to(top)} includes {name}, not an interface header")

    # Nothing internal is reachable from what is installed.
    flags = [f"-I{top / d}" for d in ["include", "public", "source", "streams", "filesys", "hostkit"]]
    for header in INSTALLED:
        out = subprocess.run([a.compiler, "-std=c++20", "-MM", "-MT", "x", *flags, "-x", "c++-header",
                              str(top / header)], capture_output=True, text=True)
        if out.returncode:
            faults.append(f"{header} does not compile alone: {out.stderr[:300]}")
        for dep in out.stdout.replace("\\\n", " ").split()[1:]:
            rel = pathlib.Path(dep).resolve().relative_to(top.resolve()).as_posix()
            if "/internal/" in rel or "/posix/" in rel:
                faults.append(f"{header} reaches {rel}, which is never installed")

    # Every test source is built into a program, and ctest runs each program defined.
    manifest = (pathlib.Path(a.build) / "test-manifest.txt").read_text().split("\n")
    programs = {}
    for line in filter(None, manifest):
        name, sources = line.split(":", 1)
        programs[name] = {pathlib.Path(s).resolve() for s in sources.split(",")}
    listed = set().union(*programs.values()) if programs else set()
    for path in sorted((top / "tests").rglob("*Test.cpp")):
        if path.resolve() not in listed and "install" not in path.parts:
            faults.append(f"{path.relative_to(top)} is in no test program: it would never run")
    ctest = subprocess.run(["ctest", "-N"], cwd=a.build, capture_output=True, text=True).stdout
    registered = set(re.findall(r"Test\s+#\d+: (\S+)", ctest))
    for name in sorted(set(programs) - registered):
        faults.append(f"test program {name} is defined but ctest does not run it")

    for fault in faults:
        print(fault)
    print(f"layering: {len(order)} subsystems, {len(programs)} test programs, {len(faults)} faults")
    return 1 if faults else 0


if __name__ == "__main__":
    sys.exit(main())
