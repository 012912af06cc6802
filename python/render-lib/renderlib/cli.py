"""Command line of the binding: ``python -m renderlib info``."""
import argparse
import os
import subprocess
import sys

import _renderlib
from renderlib import effects


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


def main(argv=None):
    parser = argparse.ArgumentParser(prog="renderlib", description=__doc__)
    commands = parser.add_subparsers(dest="command", required=True)
    commands.add_parser("info", help=info.__doc__).set_defaults(run=info)
    args = parser.parse_args(argv)
    try:
        return args.run(args)
    except RuntimeError as error:  # an engine abort
        print("renderlib: %s" % error, file=sys.stderr)
        return 2
