"""The SQLite extension from Python's sqlite3 module, as a Python user loads it.

Usage: load_extension.py PATH-OF-THE-EXTENSION
"""
import sqlite3
import sys

db = sqlite3.connect(":memory:")
db.enable_load_extension(True)
db.load_extension(sys.argv[1])
db.enable_load_extension(False)

got = db.execute("SELECT sysfun_left(?, 5) || '|', JULIAN_DAY(?), sysfun_lcase(?), "
                 "length(REPEAT('a', 100000))", ("abc", "2001-09-27", b"ABC")).fetchone()
assert got == ("abc  |", 2452180, b"abc", 100000), got
got = db.execute("SELECT exports FROM sysfun_functions WHERE name = 'sysfun_left'").fetchone()
assert got == ("CLI_udfLEFT1, CLI_udfLEFT2",), got

# A SYSFUN error reaches Python as sqlite3.OperationalError with its words.
try:
    db.execute("SELECT JULIAN_DAY('2001-02-29')").fetchone()
    sys.exit("JULIAN_DAY('2001-02-29') did not fail")
except sqlite3.OperationalError as error:
    assert "SYSFUN:04" in str(error), error

# Python's own functions and ours in one query, over a table.
db.execute("CREATE TABLE sales (sold_on TEXT, amount REAL)")
db.executemany("INSERT INTO sales VALUES (?, ?)",
               [(f"2026-{m:02d}-15", m * 10.0) for m in range(1, 13)])
db.create_function("halve", 1, lambda x: x / 2)
got = db.execute("SELECT QUARTER(sold_on), sum(halve(amount)) FROM sales "
                 "GROUP BY 1 ORDER BY 1").fetchall()
assert got == [(1, 30.0), (2, 75.0), (3, 120.0), (4, 165.0)], got
