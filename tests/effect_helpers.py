"""Walking the reference engine's catalogues from tests."""

from renderlib import effects


def all_entries():
    """(plug-in name, builder) for every entry of both catalogues."""
    return [(info.plugin_name, builder) for builder in (False, True) for info in effects.catalogue(builder)]


def all_params(effect):
    """Every parameter of every descriptor of an instance."""
    return [param for genotype in effect._get_genotypes() for param in genotype._get_params()]
