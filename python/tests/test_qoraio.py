import io
import os
import re
import subprocess
import sys
import warnings
from pathlib import Path

import numpy as np
import pandas as pd
import pytest

import qoraio
from qoraio._lib import ENCODING, STATUSES

ROOT = Path(__file__).resolve().parents[2]
SAMPLE = ROOT / "examples" / "sample.qsf"


def test_status_table_matches_the_public_header():
    header = (ROOT / "api" / "qoraio32.h").read_text()
    defined = {int(n): name for name, n in re.findall(r"#define (QORA_STATUS_\w+) (\d+)", header)}
    del defined[0]
    assert {code: name for code, (name, _) in STATUSES.items()} == defined


def _frame():
    accent = "é" if ENCODING.lower().replace("-", "") == "utf8" else "e"
    return pd.DataFrame({
        "Score": [1.5, np.nan, -2.25, 1e10],
        "Count": np.array([1, 2, 3, 40000], np.int64),
        "Town": ["Paris", "", "Lyon  x", "N" + accent + "mes"],
        "Long": ["a" * 600, "b", "", "c" * 300],
        "Born": pd.to_datetime(["1970-01-01", None, "2000-02-29", "1700-01-01"]),
        "Seen": pd.to_datetime(["2020-05-01 12:30:15.5", "2021-01-01", None, "1999-12-31 23:59:59"]),
        "Sex": pd.Categorical(["m", "f", None, "m"], categories=["m", "f"]),
    })


META = {
    "id_string": "Round trip",
    "weight": "Count",
    "variables": [
        {"name": "Score", "label": "The score", "missing_values": [99.0], "missing_range": (-9.0, -5.0),
         "measure": 3, "alignment": 2, "column_width": 12, "print_format": (5, 10, 3)},
        {"name": "Town", "width": 8, "value_labels": {"Paris": "Capital"}, "missing_values": ["none"]},
        {"name": "Count", "value_labels": {1.0: "one", 2.0: "two"}},
    ],
}


@pytest.mark.parametrize("compress", [True, False])
def test_a_frame_and_its_dictionary_round_trip(tmp_path, compress):
    frame, path = _frame(), tmp_path / "rt.qsf"
    qoraio.write(frame, path, meta=META, compress=compress)
    back = qoraio.read(path, labels=True)
    towns = ["Capital"] + frame.Town.tolist()[1:]
    expected = frame.assign(Count=pd.Categorical(["one", "two", "3", "40000"], categories=["one", "two", "3", "40000"]),
                            Town=pd.Categorical(towns, categories=["Capital"] + sorted(towns[1:])))
    pd.testing.assert_frame_equal(back, expected)

    meta = qoraio.read_meta(path)
    file_items = (meta["id_string"], meta["weight"], meta["compressed"], meta["case_count"])
    assert file_items == ("Round trip", "Count", compress, 4)
    score, count, town, long_, born, seen, sex = meta["variables"]
    assert {k: score[k] for k in META["variables"][0]} == META["variables"][0]
    assert (town["width"], town["value_labels"], town["missing_values"]) == (8, {"Paris": "Capital"}, ["none"])
    inferred = (count["print_format"], long_["width"], born["print_format"], seen["print_format"])
    assert inferred == ((5, 8, 0), 600, (20, 11, 0), (22, 20, 0))
    assert sex["value_labels"] == {1.0: "m", 2.0: "f"}

    # The frame with labels and the dictionary read back write the same file again.
    qoraio.write(back, tmp_path / "again.qsf", meta=meta, compress=compress)
    assert qoraio.read_meta(tmp_path / "again.qsf") == meta
    pd.testing.assert_frame_equal(qoraio.read(tmp_path / "again.qsf"), qoraio.read(path))


def test_case_ranges_read_as_slices(tmp_path):
    frame = pd.DataFrame({"N": np.arange(100.0), "S": ["s%d" % i for i in range(100)]})
    qoraio.write(frame, tmp_path / "r.qsf")
    for start, stop in [(10, 20), (95, None), (-5, None), (0, 0), (200, 300), (None, 3)]:
        part = qoraio.read(tmp_path / "r.qsf", cases=(start, stop))
        pd.testing.assert_frame_equal(part, frame[start:stop].reset_index(drop=True))
    assert list(qoraio.read(tmp_path / "r.qsf", columns=["S", "N"]).columns) == ["S", "N"]
    with pytest.raises(KeyError):
        qoraio.read(tmp_path / "r.qsf", columns=["Nope"])


def test_user_missing_values_become_nan_unless_kept(tmp_path):
    frame = pd.DataFrame({"A": [1.0, 99.0, -7.0, -5.0, 3.0]})
    meta = {"variables": [{"name": "A", "missing_values": [99.0], "missing_range": (-9.0, -5.0)}]}
    qoraio.write(frame, tmp_path / "m.qsf", meta=meta)
    assert qoraio.read(tmp_path / "m.qsf").A.tolist()[::4] == [1.0, 3.0]
    assert qoraio.read(tmp_path / "m.qsf").A.isna().tolist() == [False, True, True, True, False]
    pd.testing.assert_frame_equal(qoraio.read(tmp_path / "m.qsf", user_missing=True), frame)


def test_the_sample_file_reads_as_the_dump_tool_prints_it():
    build = Path(os.environ.get("QORAIO_LIBRARY_DIR", ROOT / "build"))
    dump = subprocess.run([build / "tools" / "qoradump", "--cases", SAMPLE], capture_output=True, check=True).stdout
    expected = pd.read_csv(io.BytesIO(dump), dtype=str, keep_default_na=False)
    with warnings.catch_warnings(record=True) as caught:
        warnings.simplefilter("always")
        frame = qoraio.read(SAMPLE, user_missing=True)
    assert len(caught) == 1 and pd.isna(frame.Born[5])  # 14 October 1582 is beyond datetime64[ns]
    assert list(frame.columns) == list(expected.columns)
    for name in frame.columns:
        got = frame[name]
        if got.dtype == object:
            shown = got
        elif name == "Born":
            shown = got.dt.strftime("%Y-%m-%d").fillna("1582-10-14").where(expected.Born != "", "")
        else:
            shown = got.map(lambda x: "" if np.isnan(x) else "%g" % x)
        assert shown.tolist() == expected[name].tolist(), name


def test_bad_files_raise_with_the_status_name(tmp_path):
    data = SAMPLE.read_bytes()
    cases = [("missing.qsf", None), ("empty.qsf", b""), ("noise.qsf", b"$FL2" + bytes(range(256)) * 4),
             ("half.qsf", data[: len(data) // 2]), ("cut.qsf", data[:-40])]
    for name, content in cases:
        if content is not None:
            (tmp_path / name).write_bytes(content)
        with pytest.raises(qoraio.QoraError) as error:
            qoraio.read(tmp_path / name)
        assert error.value.name.startswith("QORA_STATUS_") and error.value.name in str(error.value)

    # A header that claims more cases than the file holds yields those it holds.
    qoraio.write(pd.DataFrame({"A": np.arange(50.0)}), tmp_path / "raw.qsf", compress=False)
    data = bytearray((tmp_path / "raw.qsf").read_bytes())
    data[80:84] = (2**31 - 1).to_bytes(4, sys.byteorder)
    (tmp_path / "raw.qsf").write_bytes(data)
    assert qoraio.read(tmp_path / "raw.qsf").A.tolist() == list(range(50))


def test_a_refused_frame_leaves_no_file(tmp_path):
    with pytest.raises(qoraio.QoraError) as error:
        qoraio.write(pd.DataFrame({"1st": [1.0]}), tmp_path / "bad.qsf")
    assert error.value.name == "QORA_STATUS_BAD_VAR_NAME"
    assert not (tmp_path / "bad.qsf").exists()
