"""What a sweep needs besides the tree: built once, outside of any world."""

import hashlib
import os
import pathlib
import subprocess
import tempfile

HERE = pathlib.Path(__file__).resolve().parent
ROOT = HERE.parent.parent
LOCKDOWN = "_Bool logoff(void);\n_Bool logoff(void)\n{\n    return 1;\n}\n"


def pieces(launcher):
    """The launcher's bytes, and those of a stand-in, a session library and a library that fails allocations."""
    launcher = pathlib.Path(launcher).read_bytes()
    width = "-m32" if launcher[4] == 1 else "-m64"
    compiler = os.environ.get("CC", "cc")
    with tempfile.TemporaryDirectory() as folder:
        def built(name, *words):
            subprocess.run([compiler, "-O1", *words, "-o", name], cwd=folder, check=True)
            return pathlib.Path(folder, name).read_bytes()

        pathlib.Path(folder, "lockdown.c").write_text(LOCKDOWN)
        return {
            "launcher": launcher,
            "stand_in": built("stand-in", "-static", str(HERE.parent / "launch" / "stand_in.c")),
            "lockdown": built("lockdown.so", width, "-shared", "-fPIC", "-nostdlib", "lockdown.c"),
            "no_memory": built("no_memory.so", width, "-shared", "-fPIC", str(HERE / "no_memory.c"), "-ldl"),
        }


def sanitized(built):
    """Whether the launcher has the address sanitizer."""
    return b"__asan_init" in built["launcher"]


def sources_digest():
    """Twelve digits that stand for the launcher's sources, so that figures are not taken for another tree's."""
    found = hashlib.sha256()
    for top in ("diag", "platform", "launcher"):
        for path in sorted((ROOT / top).rglob("*")):
            if path.suffix in (".cpp", ".h"):
                found.update(str(path.relative_to(ROOT)).encode() + b"\0" + path.read_bytes() + b"\0")
    return found.hexdigest()[:12]
