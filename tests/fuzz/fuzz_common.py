"""What the Python fuzz targets share: the byte reader that turns fuzz data into
choices, and the driver that runs a target either under atheris (coverage
guided, with libFuzzer's flags) or, without it, over a corpus and a fixed
number of generated inputs (the short run of the test suite).

    python fuzz_<subject>.py [libFuzzer flags] [corpus folders]       atheris
    python fuzz_<subject>.py --replay [--inputs N] [--seed S] [paths]  no atheris

A replay run prints "replayed C corpus inputs and G generated inputs" when
every input passed; a failing input is printed (base64) before the exception
ends the run, and a crash is reproduced by the same command line."""
import base64
import faulthandler
import os
import pathlib
import random
import sys

FUZZ_DIR = pathlib.Path(__file__).resolve().parent
TESTS_DIR = FUZZ_DIR.parent
if str(TESTS_DIR) not in sys.path:
    sys.path.insert(0, str(TESTS_DIR))



class ByteReader:
    """Choices drawn from fuzz data, front to back; an exhausted reader
    answers zeros, so every input decodes to something."""

    def __init__(self, data):
        self.data = data
        self.at = 0

    def remaining(self):
        return len(self.data) - self.at

    def byte(self):
        if self.at >= len(self.data):
            return 0
        self.at += 1
        return self.data[self.at - 1]

    def bytes(self, count):
        part = self.data[self.at:self.at + count]
        self.at += len(part)
        return part

    def uint(self, size):
        raw = self.bytes(size)
        # The interpreter's int.from_bytes of all-zero bytes leaves a digit of
        # the new int unset (harmless), which memcheck reports as it is read.
        return int.from_bytes(raw, "little") if any(raw) else 0

    def int_in(self, low, high):
        """An integer in [low, high]."""
        span = high - low + 1
        size = 1 if span <= 0x100 else 2 if span <= 0x10000 else 4 if span <= 1 << 32 else 8
        return low + self.uint(size) % span

    def flag(self):
        return bool(self.byte() & 1)

    def one_in(self, count):
        """True about once in `count` draws; False once the data is used up."""
        return self.byte() % count == count - 1

    def pick(self, options):
        return options[self.int_in(0, len(options) - 1)]

    def int32(self):
        return self.uint(4) - (1 << 31)

    def float32(self):
        import struct
        return struct.unpack("<f", self.bytes(4).ljust(4, b"\0"))[0]


def replay(test_one_input, paths, inputs, seed, max_len):
    """Runs every file under `paths`, then `inputs` inputs drawn from a
    seeded generator (random bytes, and the corpus files changed a little)."""
    corpus = []
    for path in map(pathlib.Path, paths):
        files = sorted(p for p in path.rglob("*") if p.is_file()) if path.is_dir() else [path]
        corpus.extend(f.read_bytes() for f in files)
    rng = random.Random(seed)

    def generated():
        for _ in range(inputs):
            if corpus and rng.random() < 0.6:
                data = bytearray(rng.choice(corpus))
                for _ in range(rng.randint(1, 8)):
                    what = rng.randrange(4)
                    if what == 0 and data:
                        data[rng.randrange(len(data))] = rng.randrange(256)
                    elif what == 1:
                        data.insert(rng.randint(0, len(data)), rng.randrange(256))
                    elif what == 2 and data:
                        del data[rng.randrange(len(data))]
                    else:
                        other = rng.choice(corpus)
                        cut = rng.randint(0, len(data))
                        data[cut:] = other[rng.randint(0, len(other)):]
                yield bytes(data[:max_len])
            else:
                yield bytes(rng.randrange(256) for _ in range(rng.randint(0, max_len)))

    for count, source in ((len(corpus), corpus), (inputs, generated())):
        for data in source:
            try:
                test_one_input(data)
            except BaseException:
                sys.stderr.write("failing input (base64): %s\n" % base64.b64encode(data).decode())
                raise
    print("replayed %d corpus inputs and %d generated inputs" % (len(corpus), inputs), flush=True)


def instrument(*namespaces):
    """Python coverage for the target's own functions (atheris only): the
    choices it makes from the data become coverage the fuzzer can follow."""
    import atheris
    import inspect
    for namespace in namespaces:
        for value in list(vars(namespace).values()):
            if inspect.isfunction(value) and value.__module__ == namespace.__name__:
                atheris.instrument_func(value)


def main(test_one_input, target_module, max_len=4096, default_inputs=2000):
    """The entry point of a target script."""
    argv = list(sys.argv)
    faulthandler.enable()
    if "--replay" in argv:
        argv.remove("--replay")
        inputs, seed, paths = default_inputs, 0, []
        rest = iter(argv[1:])
        for arg in rest:
            if arg == "--inputs":
                inputs = int(next(rest))
            elif arg == "--seed":
                seed = int(next(rest))
            elif not arg.startswith("--"):  # the target's own flags start with "--"
                paths.append(arg)
        replay(test_one_input, paths, inputs, seed, max_len)
        return
    import atheris
    instrument(target_module)
    # libFuzzer runs argv[0] through the shell for -merge, -fork and the
    # like: the same interpreter and script, the rest of the flags after it
    # (it ignores those that start with "--", the target's own).
    argv[0] = "%s %s" % (sys.executable, os.path.abspath(argv[0]))
    if not any(arg.startswith("-max_len=") for arg in argv):
        argv.insert(1, "-max_len=%d" % max_len)
    atheris.Setup(argv, test_one_input)
    atheris.Fuzz()


def byte_address_module(folder=None):
    """The tests' second SWIG module (tests/shared_registry.i), whose
    byte_address(buffer, offset) gives the uchar_t pointer proxy that
    base64decode takes. Built into `folder` (default: the environment's
    RENDERLIB_FUZZ_HELPERS, else build-fuzz/helpers/ of the work tree) unless
    it is there already."""
    import importlib
    import sysconfig
    from native_build import REPO, build_swig_module
    folder = pathlib.Path(folder or os.environ.get("RENDERLIB_FUZZ_HELPERS")
                          or REPO / "build-fuzz" / "helpers" / sysconfig.get_config_var("SOABI"))
    if not (folder / ("_shared_registry" + sysconfig.get_config_var("EXT_SUFFIX"))).exists():
        folder.mkdir(parents=True, exist_ok=True)
        build_swig_module(TESTS_DIR / "shared_registry.i", folder, [REPO / "engine-api"])
    sys.path.insert(0, str(folder))
    return importlib.import_module("shared_registry")
