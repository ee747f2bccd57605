"""What the starts are measured with and compared to: built once, outside of any world, and kept as bytes."""

import os
import pathlib
import shutil
import subprocess
import sys
import tempfile
import zipfile

HERE = pathlib.Path(__file__).resolve().parent
ROOT = HERE.parent
STRICT = ["-std=c11", "-O2", "-Wall", "-Wextra", "-Wshadow", "-Werror"]
BARE = ["-ffreestanding", "-fno-stack-protector", "-nostdlib"]
HARDENED = ["-Wl,-z,relro,-z,now"]
SHARED = ["-fPIE", "-pie", *HARDENED]  # linked as velmora is
# Each with its source and what the compiler is told besides.
COMPILED = {
    "stopwatch": ("stopwatch.c", ["-static"]),
    "child": ("child.c", ["-static", *BARE]),
    "libjli.so": ("jli.c", ["-shared", "-fPIC", *BARE]),
    "limit": ("limit.c", ["-static"]),
    "floor-native": ("floor.c", SHARED),
    "floor-i686": ("floor.c", [*SHARED, "-m32"]),
    "least-native": ("least.c", SHARED),
    "least-i686": ("least.c", [*SHARED, "-m32"]),
    "plain-native": ("plain.c", SHARED),
    "plain-i686": ("plain.c", [*SHARED, "-m32"]),
    "flush.so": ("flush.c", ["-shared", "-fPIC"]),
}
WIDTHS = {"native": [], "i686": ["-m32"]}
MANIFEST = "Manifest-Version: 1.0\nMain-Class: bench.Platform\n"


def need_packages():
    """Comes back when what the comparison takes is installed."""
    words = ["sh", "-c", ". tools/packages.sh && need_packages build i686 tests bench"]
    if subprocess.run(words, cwd=ROOT, check=False).returncode != 0:
        sys.exit(1)


def build_launchers(builds):
    """The launchers as they would be installed; quiet unless it goes wrong."""
    for build in builds:
        for words in (["--preset", build], ["--build", "--preset", build, "--target", "velmora", "-j2"]):
            done = subprocess.run(["cmake", *words], cwd=ROOT, stdout=subprocess.PIPE, stderr=subprocess.STDOUT,
                                  text=True, check=False)
            if done.returncode != 0:
                sys.exit(done.stdout + "error: %s could not be built" % build)


def static_launchers(launchers):
    """The bytes of each launcher with the C library inside, as "static-" and its build, made of the objects that lie
    beside it; none when they do not."""
    found = {}
    for build, launcher in launchers.items():
        objects = [pathlib.Path(launcher).parent / name
                   for name in ("CMakeFiles/velmora.dir/launcher/main.cpp.o", "libvelmora_launcher.a")]
        if not all(path.is_file() for path in objects):
            continue
        with tempfile.TemporaryDirectory() as folder:
            # The linker warns of what such a launcher could not do: that is why there is none.
            done = subprocess.run([os.environ.get("CXX", "c++"), *WIDTHS[build], "-static-pie", *HARDENED,
                                   "-Wl,--gc-sections", "-o", folder + "/velmora", *objects],
                                  stdout=subprocess.PIPE, stderr=subprocess.STDOUT, text=True, check=False)
            if done.returncode != 0:
                sys.exit(done.stdout + "error: %s could not be linked with a static C library" % build)
            found["static-" + build] = pathlib.Path(folder, "velmora").read_bytes()
    return found


def tree(folder):
    """Every file below the folder: its path from there on, its bytes, and its mode."""
    return {str(path.relative_to(folder)): (path.read_bytes(), path.stat().st_mode & 0o777)
            for path in sorted(folder.rglob("*")) if path.is_file()}


def java_launcher(folder, library):
    """The launcher that jpackage makes, with a runtime that consists of the library that would start the JVM."""
    (folder / "runtime" / "lib").mkdir(parents=True)
    (folder / "in").mkdir()
    shutil.copy(library, folder / "runtime" / "lib" / "libjli.so")
    with zipfile.ZipFile(folder / "in" / "platform.jar", "w") as archive:
        archive.writestr("META-INF/MANIFEST.MF", MANIFEST)
    subprocess.run(["jpackage", "--type", "app-image", "--name", "platform", "--input", "in", "--main-jar",
                    "platform.jar", "--main-class", "bench.Platform", "--runtime-image", "runtime", "--dest", "out",
                    "--temp", "temp"], cwd=folder, check=True, stdout=subprocess.DEVNULL)
    return tree(folder / "out" / "platform")


def parts(launchers):
    """{"launchers": the launchers' bytes by their build, "files": what COMPILED names, "platform": the example's
    files, "java": those of the Java launcher}."""
    compiler = os.environ.get("CC", "cc")
    with tempfile.TemporaryDirectory() as name:
        folder = pathlib.Path(name)
        for target, (source, words) in COMPILED.items():
            if subprocess.run([compiler, *STRICT, *words, "-o", target, str(HERE / source)], cwd=folder,
                              check=False).returncode != 0:
                sys.exit("error: %s could not be compiled" % source)
        files = {target: (folder / target).read_bytes() for target in COMPILED}
        files["naive.sh"] = (HERE / "naive.sh").read_bytes()
        return {"launchers": {build: pathlib.Path(path).read_bytes() for build, path in launchers.items()},
                "files": files, "platform": tree(ROOT / "example" / "platform"),
                "java": java_launcher(folder, folder / "libjli.so")}
