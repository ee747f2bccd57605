"""What a folder holds, whole: for comparing everything before and after."""

import os


def contents(top):
    """Path below the folder: the text of a file, "-> target" of a link, None of a folder. Bytes that are no UTF-8
    become surrogates; a file that its owner may not read is read all the same, and so is such a folder."""
    found = {}
    for name in sorted(os.listdir(top)):
        path = os.path.join(top, name)
        if os.path.islink(path):
            found[name] = "-> " + os.readlink(path)
        elif os.path.isdir(path):
            found[name + "/"] = None
            with readable(path, 0o700):
                found.update((name + "/" + below, what) for below, what in contents(path).items())
        else:
            with readable(path, 0o400), open(path, "rb") as file:
                found[name] = file.read().decode("utf-8", "surrogateescape")
    return found


class readable:
    """The path has these bits of its mode for as long as the block lasts."""

    def __init__(self, path, bits):
        self._path, self._bits = path, bits

    def __enter__(self):
        self._mode = os.stat(self._path).st_mode & 0o7777
        if self._mode & self._bits != self._bits:
            os.chmod(self._path, self._mode | self._bits)

    def __exit__(self, *trouble):
        if self._mode & self._bits != self._bits:
            os.chmod(self._path, self._mode)
