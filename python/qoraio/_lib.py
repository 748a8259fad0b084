"""The library and its calls as Python sees them: where the shared objects
are found, the prototypes of the calls the package uses, the text encoding
of the interface, and the exception that carries a status code."""

import ctypes
import locale
import os
from pathlib import Path

# Every status a call may return, with its name and a plain sentence.
STATUSES = {
    1: ("QORA_STATUS_CANNOT_OPEN", "the file cannot be opened"),
    2: ("QORA_STATUS_WRITE_FAILED", "writing the case data failed"),
    3: ("QORA_STATUS_READ_FAILED", "reading the case data failed"),
    4: ("QORA_STATUS_TOO_MANY_FILES", "too many files are open"),
    5: ("QORA_STATUS_BAD_FILE_HANDLE", "the file handle is not valid"),
    6: ("QORA_STATUS_BAD_FILE", "the file is not a readable system file"),
    7: ("QORA_STATUS_NO_MEMORY", "there is not enough memory"),
    8: ("QORA_STATUS_OPENED_FOR_READING", "the file is opened for reading"),
    9: ("QORA_STATUS_NOT_OPENED_FOR_READING", "the file is not opened for reading"),
    10: ("QORA_STATUS_BAD_VAR_NAME", "the variable name is not valid"),
    11: ("QORA_STATUS_NO_VARIABLES", "the dictionary has no variables"),
    12: ("QORA_STATUS_VAR_NOT_FOUND", "there is no such variable"),
    13: ("QORA_STATUS_DUPLICATE_VAR", "the variable name is already defined"),
    14: ("QORA_STATUS_NUMERIC_REQUIRED", "the variable must be numeric"),
    15: ("QORA_STATUS_STRING_REQUIRED", "the variable must be a string"),
    16: ("QORA_STATUS_SHORT_STRING_REQUIRED", "the string variable must be 8 bytes or narrower"),
    17: ("QORA_STATUS_BAD_VAR_TYPE", "the variable type is not valid"),
    18: ("QORA_STATUS_BAD_MISSING_SPEC", "the missing values are not valid"),
    20: ("QORA_STATUS_BAD_PRINT_FORMAT", "the print format is not valid"),
    21: ("QORA_STATUS_BAD_WRITE_FORMAT", "the write format is not valid"),
    22: ("QORA_STATUS_BAD_DATE", "the date is not valid"),
    23: ("QORA_STATUS_BAD_TIME", "the time is not valid"),
    25: ("QORA_STATUS_WIDTH_MISMATCH", "the string variables differ in width"),
    29: ("QORA_STATUS_NO_SYSTEM_FILE", "the handle gives no system file"),
    30: ("QORA_STATUS_DICT_COMMITTED", "the dictionary is already committed"),
    31: ("QORA_STATUS_DICT_NOT_COMMITTED", "the dictionary is not committed yet"),
    41: ("QORA_STATUS_NO_RELEASE_INFO", "the file carries no release information"),
    45: ("QORA_STATUS_BAD_DATE_INFO", "the date variable information is not valid"),
    47: ("QORA_STATUS_STRING_TOO_LONG", "the string is longer than the variable"),
    48: ("QORA_STATUS_CANNOT_FREE", "the memory cannot be freed"),
    49: ("QORA_STATUS_BUFFER_TOO_SHORT", "the buffer is too short"),
    50: ("QORA_STATUS_NO_CURRENT_CASE", "no case is loaded"),
    52: ("QORA_STATUS_CANNOT_APPEND", "cases cannot be added to this file"),
    57: ("QORA_STATUS_BAD_EXTENSION", "that extension record may not be touched"),
    58: ("QORA_STATUS_BAD_VAR_HANDLE", "the variable handle is not valid"),
    59: ("QORA_STATUS_BAD_ENCODING", "the interface encoding is not valid"),
    60: ("QORA_STATUS_FILES_OPEN", "files are open"),
    70: ("QORA_STATUS_BAD_MRSET_DEF", "the multiple response set is not valid"),
    71: ("QORA_STATUS_BAD_MRSET_NAME", "the multiple response set name is not valid"),
    72: ("QORA_STATUS_DUPLICATE_MRSET", "the multiple response set is already defined"),
    73: ("QORA_STATUS_BAD_SUBTYPE", "the extension subtype is not valid"),
    75: ("QORA_STATUS_BAD_ATTR_NAME", "the attribute name is not valid"),
    76: ("QORA_STATUS_BAD_ATTR_DEF", "the attribute is not valid"),
    77: ("QORA_STATUS_BAD_MRSET_INDEX", "there is no multiple response set of that index"),
}

END_OF_FILE = -5
NO_LABELS = -8
NO_LABEL = -9


class QoraError(Exception):
    """A call of the library failed. `status` is the code, `name` its name."""

    def __init__(self, status, what):
        self.status = status
        self.name, sentence = STATUSES.get(status, ("QORA_STATUS_%d" % status, "unknown status"))
        super().__init__("%s (%s, %d): %s" % (what, self.name, status, sentence))


def check(status, what):
    """Raises for an error; warnings and success pass."""
    if status > 0:
        raise QoraError(status, what)
    return status


def _find(name):
    """The shared object in the folder QORAIO_LIBRARY_DIR names, beside the
    package, in the build folder of the source tree, or wherever the loader
    finds installed libraries."""
    here = Path(__file__).resolve().parent
    chosen = os.environ.get("QORAIO_LIBRARY_DIR")
    for folder in [Path(chosen)] if chosen else [here, here.parent.parent / "build"]:
        if (folder / name).exists():
            return str(folder / name)
    return name


_c = ctypes
_int, _dbl, _str, _p = _c.c_int, _c.c_double, _c.c_char_p, _c.POINTER
_PROTOTYPES = {
    "qoraOpenRead": [_str, _p(_int)],
    "qoraOpenWrite": [_str, _p(_int)],
    "qoraCloseRead": [_int],
    "qoraCloseWrite": [_int],
    "qoraGetNumberofCases": [_int, _p(_int)],
    "qoraGetCaseSize": [_int, _p(_int)],
    "qoraGetCompression": [_int, _p(_int)],
    "qoraSetCompression": [_int, _int],
    "qoraCommitHeader": [_int],
    "qoraGetIdString": [_int, _str],
    "qoraSetIdString": [_int, _str],
    "qoraGetCaseWeightVar": [_int, _str],
    "qoraSetCaseWeightVar": [_int, _str],
    "qoraGetVarNames": [_int, _p(_int), _p(_p(_str)), _p(_p(_int))],
    "qoraFreeVarNames": [_p(_str), _p(_int), _int],
    "qoraSetVarName": [_int, _str, _int],
    "qoraGetVarLabelLong": [_int, _str, _str, _int, _p(_int)],
    "qoraSetVarLabel": [_int, _str, _str],
    "qoraGetVarPrintFormat": [_int, _str, _p(_int), _p(_int), _p(_int)],
    "qoraGetVarWriteFormat": [_int, _str, _p(_int), _p(_int), _p(_int)],
    "qoraSetVarPrintFormat": [_int, _str, _int, _int, _int],
    "qoraSetVarWriteFormat": [_int, _str, _int, _int, _int],
    "qoraGetVarNMissingValues": [_int, _str, _p(_int), _p(_dbl), _p(_dbl), _p(_dbl)],
    "qoraSetVarNMissingValues": [_int, _str, _int, _dbl, _dbl, _dbl],
    "qoraGetVarCMissingValues": [_int, _str, _p(_int), _str, _str, _str],
    "qoraSetVarCMissingValues": [_int, _str, _int, _str, _str, _str],
    "qoraGetVarMeasureLevel": [_int, _str, _p(_int)],
    "qoraSetVarMeasureLevel": [_int, _str, _int],
    "qoraGetVarAlignment": [_int, _str, _p(_int)],
    "qoraSetVarAlignment": [_int, _str, _int],
    "qoraGetVarColumnWidth": [_int, _str, _p(_int)],
    "qoraSetVarColumnWidth": [_int, _str, _int],
    "qoraGetVarNValueLabels": [_int, _str, _p(_p(_dbl)), _p(_p(_str)), _p(_int)],
    "qoraFreeVarNValueLabels": [_p(_dbl), _p(_str), _int],
    "qoraGetVarCValueLabels": [_int, _str, _p(_p(_str)), _p(_p(_str)), _p(_int)],
    "qoraFreeVarCValueLabels": [_p(_str), _p(_str), _int],
    "qoraSetVarNValueLabel": [_int, _str, _dbl, _str],
    "qoraSetVarCValueLabel": [_int, _str, _str, _str],
    "qoraGetFileAttributes": [_int, _p(_p(_str)), _p(_p(_str)), _p(_int)],
    "qoraGetVarAttributes": [_int, _str, _p(_p(_str)), _p(_p(_str)), _p(_int)],
    "qoraFreeAttributes": [_p(_str), _p(_str), _int],
    "qoraSeekNextCase": [_int, _int],
    "qoraWholeCaseIn": [_int, _c.c_void_p],
    "qoraWholeCaseOut": [_int, _c.c_void_p],
}
# Calls that other parts of the library may not offer yet: used when present.
_OPTIONAL = {
    "qoraSetInterfaceEncoding": [_int],
    "qoraSetFileAttributes": [_int, _p(_str), _p(_str), _int],
    "qoraSetVarAttributes": [_int, _str, _p(_str), _p(_str), _int],
}


def _load():
    lib = ctypes.CDLL(_find("libqoraio32.so"))
    for table, required in ((_PROTOTYPES, True), (_OPTIONAL, False)):
        for name, argtypes in table.items():
            if not required and not hasattr(lib, name):
                continue
            call = getattr(lib, name)
            call.argtypes, call.restype = argtypes, _int
    loops = ctypes.CDLL(_find("libqoraio_cases.so"))
    loops.qoraio_read_cases.argtypes = [_c.c_void_p, _int, _c.c_void_p, _c.c_int64, _int,
                                        _c.c_void_p, _int, _p(_c.c_int64)]
    loops.qoraio_write_cases.argtypes = [_c.c_void_p, _int, _c.c_void_p, _c.c_int64, _int,
                                         _c.c_void_p, _int]
    loops.qoraio_read_cases.restype = loops.qoraio_write_cases.restype = _int
    return lib, loops


lib, loops = _load()


def has(name):
    """Whether the library offers an optional call."""
    return hasattr(lib, name)


def _interface_encoding():
    """UTF-8 where the library can be switched to it; otherwise the code page
    of the locale, which the library takes from the environment at load."""
    if has("qoraSetInterfaceEncoding") and lib.qoraSetInterfaceEncoding(1) == 0:
        return "utf-8"
    return locale.nl_langinfo(locale.CODESET) or "ascii"


ENCODING = _interface_encoding()


def text(value):
    """Bytes of the interface as a Python str."""
    return value.decode(ENCODING, "replace") if value is not None else None


def raw(value):
    """A Python str as bytes of the interface; text the encoding cannot hold
    is refused rather than stored altered."""
    try:
        return value.encode(ENCODING)
    except UnicodeEncodeError as error:
        raise ValueError("%r cannot be written in %s" % (value, ENCODING)) from error


def file_name(path):
    return os.fsencode(os.fspath(path))
