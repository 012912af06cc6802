"""The renderlib command line: list effects, describe one, render frames of
one to image files or to a monitor device, make a contact sheet of every
effect, and report what the module runs against.

Exit status: 0 done; 1 the engine did not render; 2 a usage error (unknown
effect, parameter or value, bad option); 3 module and engine were built
apart; 4 an image file could not be read or written; 5 a monitor device
failed."""

from __future__ import annotations

import argparse
import os
import pathlib
import re
import subprocess
import sys
from typing import TYPE_CHECKING, TypeVar, cast

import _renderlib
from renderlib import effects

if TYPE_CHECKING:
    from collections.abc import Callable, Iterable, Sequence

    import numpy
    from numpy.typing import NDArray

    from renderlib.rendering import EffectRenderer

_Item = TypeVar("_Item")

EXIT_RENDER, EXIT_USAGE, EXIT_BUILD, EXIT_FILE, EXIT_MONITOR = 1, 2, 3, 4, 5


class CommandError(Exception):
    """A one-line failure with its exit status."""

    def __init__(self, message: str, status: int) -> None:
        super().__init__(message)
        self.status = status


def user_identity() -> str | None:
    """The identity text that ``check_user`` compares, or None where it cannot
    be found: the effective uid in its POSIX security-identifier form, or the
    Windows account's security identifier."""
    if hasattr(os, "geteuid"):
        return "S-1-22-1-%d" % os.geteuid()
    try:
        out = subprocess.run(
            ["whoami", "/user", "/fo", "csv", "/nh"], capture_output=True, text=True, check=True
        ).stdout
    except (OSError, subprocess.CalledProcessError):
        return None
    return out.strip().split(",")[-1].strip('"') or None


def version(_args: argparse.Namespace) -> int:
    """Engine version, build identity and user check."""
    identity = user_identity()
    build_match = _renderlib.check_build_id()
    print("engine version:  ", _renderlib.get_tarsel_version_info())
    print("engine build id: ", _renderlib.get_tarsel_build_id())
    print("module build id: ", _renderlib.ext_build_id())
    print("build identity:  ", "match" if build_match else "MISMATCH (module and engine were built apart)")
    print("colour config:   ", _renderlib.get_ocio_path() or "(none)")
    if identity is None:
        print("user check:       identity unknown on this platform")
    else:
        print("user check:      ", identity, "->", "ok" if _renderlib.check_user(identity) else "FAILED")
    return 0 if build_match else EXIT_BUILD


def list_effects(_args: argparse.Namespace) -> int:
    """Both effect catalogues, with categories."""
    for builder, title in ((False, "Effects"), (True, "Effect builder")):
        entries = effects.catalogue(builder)
        print("%s (%d)" % (title, len(entries)))
        for entry in filter(None, entries):
            print("  %-16s %s" % (entry.plugin_name, entry._category))
    return 0


def describe(args: argparse.Namespace) -> int:
    """An effect's inputs and parameters: type, default, limits, states, group."""
    from renderlib.rendering import effect_instance

    instance = effect_instance(args.effect)
    try:
        genotype = instance.effect_genotype
        if genotype is None:
            raise CommandError("%s has no effect descriptor" % args.effect, EXIT_USAGE)
        print("%s  (%s)" % (args.effect, "effect builder" if effects.is_builder_effect(args.effect) else "effect"))
        print("inputs: %s" % (", ".join(genotype._get_input_names()) or "none"))
        print("parameters:")
        for param in filter(None, genotype._get_params()):
            name = param.get_canonical_name()
            if not name:
                continue
            lower, upper, _, _ = param.get_limits()
            limits = (
                ""
                if param.ptype_name() in ("popup", "boolean", "push button")
                else "  [%s .. %s]" % (_number(lower), _number(upper))
            )
            states = param.get_state_names()
            group = genotype.get_param_group_name(param)
            print(
                "  %-18s %-12s default %s%s%s%s"
                % (
                    name,
                    param.ptype_name(),
                    param.to_string(None) or '""',
                    limits,
                    "  states: %s" % " | ".join(map(str, states)) if states else "",
                    "  group: %s" % group if group else "",
                )
            )
    finally:
        _renderlib.free_tarsel_effect(instance)
    return 0


def _number(value: float | None) -> str:
    return "none" if value is None else "%g" % value


def frame_range(text: str) -> range:
    match = re.fullmatch(r"(-?\d+)(?:-(-?\d+))?", text)
    if not match or int(match.group(2) or match.group(1)) < int(match.group(1)):
        raise argparse.ArgumentTypeError("a frame range reads N or FIRST-LAST, such as 0-24")
    first = int(match.group(1))
    return range(first, int(match.group(2) or first) + 1)


def size(text: str) -> tuple[int, int]:
    width_text, _, height_text = text.partition("x")
    try:
        width, height = int(width_text), int(height_text)
    except ValueError:
        width = height = 0
    if width <= 0 or height <= 0:
        raise argparse.ArgumentTypeError("a size reads WIDTHxHEIGHT, such as 640x360")
    return width, height


def parameter(text: str) -> tuple[str, str]:
    name, equals, value = text.partition("=")
    if not equals or not name:
        raise argparse.ArgumentTypeError("a parameter reads NAME=VALUE, such as radius=12")
    return name, value


def frame_path(pattern: str | os.PathLike[str], frame: int) -> str:
    """`pattern` with its run of '#' (or a printf %d field) replaced by the frame."""
    pattern = str(pattern)
    hashes = re.search(r"#+", pattern)
    if hashes:
        return pattern[: hashes.start()] + "%0*d" % (len(hashes.group()), frame) + pattern[hashes.end() :]
    if re.search(r"%0?\d*d", pattern):
        return pattern % frame
    return pattern


def _is_sequence(pattern: str | os.PathLike[str]) -> bool:
    return frame_path(pattern, 0) != frame_path(pattern, 1)


def _inputs(paths: Iterable[str]) -> list[Callable[..., NDArray[numpy.float32]]]:
    """One frame function per input file (a sequence pattern or a still)."""
    from renderlib.images import read_image

    sources = []
    for path in paths:
        if _is_sequence(path):
            sources.append(lambda frame, path=path: read_image(frame_path(path, frame)))
        else:
            still = read_image(path)
            sources.append(lambda frame, still=still: still)
    return sources


def _renderer(args: argparse.Namespace, width: int, height: int) -> EffectRenderer:
    from renderlib.rendering import EffectRenderer, card_frame

    sources = _inputs(args.input)
    renderer = EffectRenderer(args.effect, dict(args.param), colorspace=args.colorspace)
    if len(sources) > renderer.n_inputs:
        renderer.close()
        raise CommandError(
            "%s takes %d input(s), %d given" % (args.effect, renderer.n_inputs, len(sources)), EXIT_USAGE
        )
    # Inputs not given see the test card, so every effect has something to work on.
    sources += [lambda frame: card_frame(width, height, frame)] * (renderer.n_inputs - len(sources))
    renderer.inputs = list(sources)
    return renderer


def _frame_size(args: argparse.Namespace) -> tuple[int, int]:
    if args.size:
        return cast("tuple[int, int]", args.size)
    if args.input:
        from renderlib.images import read_image

        first = read_image(frame_path(args.input[0], args.frames[0]))
        return first.shape[1], first.shape[0]
    return 640, 360


def _progress(frames: Iterable[_Item], args: argparse.Namespace, what: str) -> Iterable[_Item]:
    from tqdm import tqdm  # type: ignore[import-untyped,unused-ignore]

    return cast(
        "Iterable[_Item]", tqdm(frames, desc=what, unit="frame", disable=True if args.quiet else None, file=sys.stderr)
    )


def render(args: argparse.Namespace) -> int:
    """Render frames of an effect to image files."""
    if len(args.frames) > 1 and not _is_sequence(args.output):
        raise CommandError(
            "rendering %d frames needs an output pattern such as out.####.png" % len(args.frames), EXIT_USAGE
        )
    width, height = _frame_size(args)
    from renderlib.images import write_image

    with _renderer(args, width, height) as renderer:
        for frame in _progress(args.frames, args, args.effect):
            write_image(frame_path(args.output, frame), renderer.render(frame, width, height), args.depth)
    if not args.quiet:
        print("%s: %d frame(s) of %dx%d" % (args.output, len(args.frames), width, height))
    return 0


def monitor(args: argparse.Namespace) -> int:
    """Show frames of an effect on a monitor device."""
    from renderlib.monitor import Monitor, devices

    if args.list or not args.effect:
        for device, modes in devices().items():
            print("%-10s %s" % (device, " ".join(modes)))
        return 0
    import numpy
    from renderlib.images import quantised

    with Monitor(args.device, args.mode) as output:
        with _renderer(args, output.width, output.height) as renderer:
            for frame in _progress(args.frames, args, "%s on %s" % (args.effect, args.device)):
                rgba = renderer.render(frame, output.width, output.height)
                bgra = numpy.ascontiguousarray(quantised(rgba, "8")[:, :, [2, 1, 0, 3]])
                output.show(bgra, name="%s %d" % (args.effect, frame))
    if not args.quiet:
        print("%s: %d frame(s) of %dx%d shown" % (args.device, len(args.frames), output.width, output.height))
    return 0


def contact_sheet(args: argparse.Namespace) -> int:
    """Render every effect of both catalogues and a contact sheet of them all."""
    from renderlib.contact_sheet import make_contact_sheet

    folder = pathlib.Path(args.output)
    sheet = make_contact_sheet(
        folder, args.size or (320, 180), args.frame, lambda items: _progress(items, args, "effects")
    )
    if not args.quiet:
        print("%s: every effect, and the contact sheet %s" % (folder, sheet))
    return 0


def _add_render_options(command: argparse.ArgumentParser, output_required: bool) -> None:
    command.add_argument("effect", nargs=None if output_required else "?", help="plug-in name, such as T_Blur")
    command.add_argument(
        "-i",
        "--input",
        action="append",
        default=[],
        metavar="IMAGE",
        help="an input image, in input order; a pattern with #### is a sequence (inputs not given see a test card)",
    )
    command.add_argument(
        "-p",
        "--param",
        action="append",
        default=[],
        type=parameter,
        metavar="NAME=VALUE",
        help="a parameter value in the engine's text form (repeatable)",
    )
    command.add_argument(
        "-f", "--frames", type=frame_range, default=range(0, 1), metavar="FIRST-LAST", help="frames to render (0)"
    )
    command.add_argument("--colorspace", default="srgb", help="output colour space (srgb)")
    command.add_argument("-q", "--quiet", action="store_true", help="no progress bar or summary")


def parser() -> argparse.ArgumentParser:
    parser = argparse.ArgumentParser(
        prog="renderlib",
        description=__doc__.split("\n\n")[0],
        formatter_class=argparse.RawDescriptionHelpFormatter,
        epilog=__doc__.split("\n\n")[1],
    )
    commands = parser.add_subparsers(dest="command", required=True, metavar="COMMAND")
    commands.add_parser("list", help=list_effects.__doc__).set_defaults(run=list_effects)
    info = commands.add_parser("info", help=describe.__doc__)
    info.add_argument("effect", help="plug-in name, such as T_Blur")
    info.set_defaults(run=describe)
    render_command = commands.add_parser("render", help=render.__doc__)
    _add_render_options(render_command, True)
    render_command.add_argument(
        "-o",
        "--output",
        required=True,
        metavar="IMAGE",
        help="image file to write (.png, .tif, ...); out.####.png for a sequence",
    )
    render_command.add_argument("--size", type=size, help="WIDTHxHEIGHT (the first input's, or 640x360)")
    render_command.add_argument(
        "--depth", choices=("8", "16", "float"), default="8", help="bits a channel of TIFF output (8)"
    )
    render_command.set_defaults(run=render)
    monitor_command = commands.add_parser("monitor", help=monitor.__doc__)
    _add_render_options(monitor_command, False)
    monitor_command.add_argument("--device", default="preview", help="monitor device (preview)")
    monitor_command.add_argument("--mode", default="640x360p25", help="device mode (640x360p25)")
    monitor_command.add_argument("--list", action="store_true", help="list devices and their modes")
    monitor_command.set_defaults(run=monitor, size=None)
    sheet = commands.add_parser("contact-sheet", help=contact_sheet.__doc__)
    sheet.add_argument("-o", "--output", default="renders", metavar="FOLDER", help="folder for the images (renders)")
    sheet.add_argument("--size", type=size, help="WIDTHxHEIGHT of each render (320x180)")
    sheet.add_argument("--frame", type=int, default=12, help="frame to render (12)")
    sheet.add_argument("-q", "--quiet", action="store_true", help="no progress bar or summary")
    sheet.set_defaults(run=contact_sheet)
    commands.add_parser("version", help=version.__doc__).set_defaults(run=version)
    return parser


def main(argv: Sequence[str] | None = None) -> int:
    args = parser().parse_args(argv)
    from renderlib.images import ImageFileError
    from renderlib.monitor import MonitorError
    from renderlib.rendering import EffectError, RenderError

    try:
        return cast(int, args.run(args))
    except CommandError as error:
        message, status = str(error), error.status
    except EffectError as error:
        message, status = "%s (see: renderlib list, renderlib info EFFECT)" % error, EXIT_USAGE
    except ImageFileError as error:
        message, status = str(error), EXIT_FILE
    except ValueError as error:  # an output format or depth the writer refuses
        message, status = str(error), EXIT_USAGE
    except MonitorError as error:
        message, status = str(error), EXIT_MONITOR
    except (RenderError, RuntimeError) as error:  # RuntimeError: an engine abort
        message, status = str(error), EXIT_RENDER
    print("renderlib: %s" % message, file=sys.stderr)
    return status
