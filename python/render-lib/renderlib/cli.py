"""Command line of the binding: ``python -m renderlib info`` and
``python -m renderlib render EFFECT -o frame.png``."""
import argparse
import os
import subprocess
import sys

import _renderlib
from renderlib import effects, png


def user_identity():
    """The identity text that ``check_user`` compares, or None where it cannot
    be found: the effective uid in its POSIX security-identifier form, or the
    Windows account's security identifier."""
    if hasattr(os, "geteuid"):
        return "S-1-22-1-%d" % os.geteuid()
    try:
        out = subprocess.run(["whoami", "/user", "/fo", "csv", "/nh"],
                             capture_output=True, text=True, check=True).stdout
    except (OSError, subprocess.CalledProcessError):
        return None
    return out.strip().split(",")[-1].strip('"') or None


def info(_args):
    """Print what this module runs against."""
    identity = user_identity()
    build_match = _renderlib.check_build_id()
    print("engine version:     ", _renderlib.get_tarsel_version_info())
    print("engine build id:    ", _renderlib.get_tarsel_build_id())
    print("module build id:    ", _renderlib.ext_build_id())
    print("build identity:     ", "match" if build_match else "MISMATCH (module and engine were built apart)")
    print("colour config:      ", _renderlib.get_ocio_path() or "(none)")
    if identity is None:
        print("user check:          identity unknown on this platform")
    else:
        print("user check:         ", identity, "->", "ok" if _renderlib.check_user(identity) else "FAILED")
    print("effects:            ", _renderlib.get_n_tarsel_effects())
    print("builder effects:    ", _renderlib.get_n_tarsel_builder_effects())
    for builder in (False, True):
        print()
        print("Effect builder catalogue" if builder else "Effect catalogue")
        for entry in effects.catalogue(builder):
            describe_effect(entry, builder)
    return 0 if build_match else 3


def describe_effect(entry, builder):
    """One catalogue entry: its inputs and parameters, read from an instance."""
    print("  %s  [%s]" % (entry.plugin_name, entry._category))
    instance = _renderlib.init_tarsel_effect(entry.plugin_name, builder)
    if instance is None:
        print("    (the engine made no instance)")
        return
    genotype = instance.effect_genotype
    print("    inputs:     %s" % (", ".join(genotype._get_input_names()) or "none"))
    for param in genotype._get_params():
        print("    %-22s %-10s %s" % (param.name, param.ptype_name(), param.to_string(None)))


def size(text):
    width, _, height = text.partition("x")
    try:
        return int(width), int(height)
    except ValueError:
        raise argparse.ArgumentTypeError("a size reads WIDTHxHEIGHT, such as 640x360")


def render(args):
    """Render one frame of an effect into a PNG file."""
    instance = _renderlib.init_tarsel_effect(args.effect, False)
    if instance is None:
        print("renderlib: no effect %r (see: python -m renderlib info)" % args.effect, file=sys.stderr)
        return 2
    width, height = args.size
    messages = []
    _renderlib.set_error_handler(lambda level, text: messages.append(text))
    try:
        # Every input sees the same test card: a gradient from the catalogue.
        card = _renderlib.init_tarsel_effect("T_Gradient", False)
        test_card = effects.raster(_renderlib.pixel_rgba8, width, height)
        effects.render(card, test_card, colorspace="srgb")
        n_inputs = len(instance.effect_genotype._get_input_names())
        dest = effects.raster(_renderlib.pixel_rgba8, width, height)
        ok = effects.render(instance, dest, [test_card] * n_inputs, frame=args.frame, colorspace="srgb")
    finally:
        _renderlib.set_error_handler(None)
    if not ok:
        print("renderlib: the engine did not render %s: %s" % (args.effect, "; ".join(messages)), file=sys.stderr)
        return 2
    png.write_rgba8(args.output, dest[1], width, height)
    print("%s: %dx%d frame %d of %s" % (args.output, width, height, args.frame, args.effect))
    return 0


def main(argv=None):
    parser = argparse.ArgumentParser(prog="renderlib", description=__doc__)
    commands = parser.add_subparsers(dest="command", required=True)
    commands.add_parser("info", help=info.__doc__).set_defaults(run=info)
    render_command = commands.add_parser("render", help=render.__doc__)
    render_command.add_argument("effect", help="plug-in name, such as T_Blur")
    render_command.add_argument("-o", "--output", required=True, help="PNG file to write")
    render_command.add_argument("--size", type=size, default=(640, 360), help="WIDTHxHEIGHT (640x360)")
    render_command.add_argument("--frame", type=int, default=0, help="frame number (0)")
    render_command.set_defaults(run=render)
    args = parser.parse_args(argv)
    try:
        return args.run(args)
    except RuntimeError as error:  # an engine abort
        print("renderlib: %s" % error, file=sys.stderr)
        return 2
