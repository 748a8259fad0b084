"""System files to and from pandas.

    df = qoraio.read("survey.qsf")                 # cases as a DataFrame
    meta = qoraio.read_meta("survey.qsf")          # the dictionary
    qoraio.write(df, "copy.qsf", meta=meta)        # and back, compressed
"""

from ._lib import QoraError
from ._read import read, read_meta
from ._write import write

__all__ = ["QoraError", "read", "read_meta", "write"]
