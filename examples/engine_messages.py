"""A host that routes the engine's messages into Python's logging and reports
what it runs against."""

import logging

import _renderlib

# Engine levels rise with severity; map them onto logging's.
LEVELS = {
    _renderlib.Err_LogOnly: logging.DEBUG,
    _renderlib.Err_NoHdrNoBeep: logging.INFO,
    _renderlib.Err_InfoNoBeep: logging.INFO,
    _renderlib.Err_NoteNoBeep: logging.INFO,
    _renderlib.Err_Info: logging.INFO,
    _renderlib.Err_Note: logging.INFO,
    _renderlib.Err_NoHdr: logging.INFO,
    _renderlib.Err_Alert: logging.WARNING,
    _renderlib.Err_Warning: logging.WARNING,
    _renderlib.Err_Error: logging.ERROR,
    _renderlib.Err_Fatal: logging.CRITICAL,
}
log = logging.getLogger("tarsel")


def on_engine_message(level, message):
    # Called from engine threads too: never raise, return None.
    try:
        log.log(LEVELS.get(level, logging.ERROR), message)
    except Exception:  # a handler must not let anything escape
        pass


def main():
    logging.basicConfig(level=logging.INFO, format="%(levelname)s %(name)s: %(message)s")
    _renderlib.set_error_handler(on_engine_message)
    if not _renderlib.check_build_id():
        log.error(
            "module %s and engine %s were not built together",
            _renderlib.ext_build_id(),
            _renderlib.get_tarsel_build_id(),
        )
        return 1
    log.info("engine: %s", _renderlib.get_tarsel_version_info())
    log.info(
        "%d effects, %d builder effects", _renderlib.get_n_tarsel_effects(), _renderlib.get_n_tarsel_builder_effects()
    )
    _renderlib.set_error_handler(None)
    return 0


if __name__ == "__main__":
    raise SystemExit(main())
