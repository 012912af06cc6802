"""What the fuzz targets share: the reader that turns fuzz data into choices,
the inputs of a short run, and the driver of a Python target: atheris with
libFuzzer's flags, or --replay [--inputs N] [--seed S] [paths] without it,
which runs the files under paths and N generated inputs, prints "replayed M
inputs" once all passed, and a failing input (base64) before its exception."""

import base64
import faulthandler
import inspect
import os
import pathlib
import random
import struct
import sys

TESTS_DIR = pathlib.Path(__file__).resolve().parents[1]
if str(TESTS_DIR) not in sys.path:
    sys.path.insert(0, str(TESTS_DIR))


class ByteReader:
    """Choices drawn from fuzz data, front to back; zeros once it is used up."""

    def __init__(self, data):
        self.data, self.at = data, 0

    def bytes(self, count):
        part = self.data[self.at : self.at + count]
        self.at += len(part)
        return part

    def uint(self, size):
        raw = self.bytes(size)
        # int.from_bytes of all-zero bytes leaves a digit of the new int unset
        # (harmless), which memcheck reports as it is read.
        return int.from_bytes(raw, "little") if any(raw) else 0

    def int_in(self, low, high):
        span = high - low + 1
        return low + self.uint(next(size for size in (1, 2, 4, 8) if span <= 1 << 8 * size)) % span

    def byte(self):
        return self.uint(1)

    def flag(self):
        return bool(self.byte() & 1)

    def one_in(self, count):  # never once the data is used up
        return self.byte() % count == count - 1

    def pick(self, options):
        return options[self.int_in(0, len(options) - 1)]

    def int32(self):
        return self.uint(4) - (1 << 31)

    def float32(self):
        return struct.unpack("<f", self.bytes(4).ljust(4, b"\0"))[0]


def inputs(paths, count, seed, max_len):
    """Every file under `paths`, then `count` inputs of a seeded generator:
    random bytes, or a file changed a little."""
    corpus = [
        file.read_bytes()
        for path in map(pathlib.Path, paths)
        for file in (sorted(p for p in path.rglob("*") if p.is_file()) if path.is_dir() else [path])
    ]
    yield from corpus
    rng = random.Random(seed)
    for _ in range(count):
        if not corpus or rng.random() < 0.4:
            size = rng.randint(0, max_len)  # the bytes rng.randbytes(size) makes, on Pythons before 3.9 too
            yield rng.getrandbits(8 * size).to_bytes(size, "little") if size else b""
            continue
        data = bytearray(rng.choice(corpus))
        for _ in range(rng.randint(1, 8)):
            what, at = rng.randrange(5), rng.randrange(len(data) + 1)
            if what == 1 or at == len(data):
                data.insert(at, rng.randrange(256))
            elif what == 0:
                data[at] = rng.randrange(256)
            elif what == 2:
                del data[at]
            elif what == 3:
                data[at] ^= 1 << rng.randrange(8)
            else:
                other = rng.choice(corpus)
                data[at:] = other[rng.randrange(len(other) + 1) :]
        yield bytes(data[:max_len])


def main(test_one_input, max_len, default_inputs=2000):
    faulthandler.enable()
    if "--replay" in sys.argv:
        options, paths, args = {"--inputs": default_inputs, "--seed": 0}, [], iter(sys.argv[1:])
        for arg in args:
            if arg in options:
                options[arg] = int(next(args))
            elif not arg.startswith("--"):  # the target's own flags start with "--" too
                paths.append(arg)
        ran = 0
        for data in inputs(paths, options["--inputs"], options["--seed"], max_len):
            ran += 1
            try:
                test_one_input(data)
            except BaseException:
                sys.stderr.write("failing input (base64): %s\n" % base64.b64encode(data).decode())
                raise
        print("replayed %d inputs" % ran, flush=True)
        return
    import atheris

    # The target's own choices become coverage the fuzzer can follow.
    for value in list(vars(sys.modules[test_one_input.__module__]).values()):
        if inspect.isfunction(value) and value.__module__ == test_one_input.__module__:
            atheris.instrument_func(value)
    # libFuzzer runs argv[0] through the shell for -merge, -fork and the like:
    # the same interpreter and script, its flags after them.
    argv = ["%s %s" % (sys.executable, os.path.abspath(sys.argv[0]))] + sys.argv[1:]
    if not any(arg.startswith("-max_len=") for arg in argv):
        argv.insert(1, "-max_len=%d" % max_len)
    atheris.Setup(argv, test_one_input)
    atheris.Fuzz()


def byte_address_module():
    """tests/shared_registry.i, whose byte_address(buffer, offset) gives base64decode's
    uchar_t pointer, built into $RENDERLIB_FUZZ_HELPERS or build-fuzz/helpers/."""
    import importlib
    import sysconfig
    from native_build import REPO, build_swig_module

    default = REPO / "build-fuzz" / "helpers" / sysconfig.get_config_var("SOABI")
    folder = pathlib.Path(os.environ.get("RENDERLIB_FUZZ_HELPERS") or default)
    if not (folder / ("_shared_registry" + sysconfig.get_config_var("EXT_SUFFIX"))).exists():
        folder.mkdir(parents=True, exist_ok=True)
        build_swig_module(TESTS_DIR / "shared_registry.i", folder, [REPO / "engine-api"])
    sys.path.insert(0, str(folder))
    return importlib.import_module("shared_registry")
