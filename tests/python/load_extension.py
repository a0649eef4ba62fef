"""The SQLite extension from Python's sqlite3 module, as a Python user loads it.

Usage: load_extension.py PATH-OF-THE-EXTENSION
"""
import sqlite3
import sys
import threading


def connect(path):
    db = sqlite3.connect(":memory:")
    db.enable_load_extension(True)
    db.load_extension(path)
    db.enable_load_extension(False)
    return db


def main(path):
    db = connect(path)
    checks = [
        ("SELECT sysfun_repeat('ab', 3), JULIAN_DAY('2001-09-27')", ("ababab", 2452180)),
        ("SELECT length(REPEAT('a', 100000))", (100000,)),
        ("SELECT sysfun_left(?, 5) || '|'", ("abc  |",), ("abc",)),
        ("SELECT DAYOFWEEK(?), WEEK_ISO(?)", (3, 48), ("2026-11-24", "2026-11-24")),
        ("SELECT sysfun_lcase(?)", (b"abc",), (b"ABC",)),
        ("SELECT count(*) > 0 FROM sysfun_functions", (1,)),
    ]
    failures = 0
    for sql, expected, *params in checks:
        got = db.execute(sql, *params).fetchone()
        if got != expected:
            print(f"{sql}: got {got!r}, expected {expected!r}", file=sys.stderr)
            failures += 1
    # A SYSFUN error reaches Python as sqlite3.OperationalError with its words.
    try:
        db.execute("SELECT JULIAN_DAY('2001-02-29')").fetchone()
        print("JULIAN_DAY('2001-02-29') did not fail", file=sys.stderr)
        failures += 1
    except sqlite3.OperationalError as error:
        if "SYSFUN:04" not in str(error):
            print(f"unexpected error: {error}", file=sys.stderr)
            failures += 1
    # Python's own functions and ours in one query, over a table.
    db.execute("CREATE TABLE sales (sold_on TEXT, amount REAL)")
    db.executemany("INSERT INTO sales VALUES (?, ?)",
                   [(f"2026-{m:02d}-15", m * 10.0) for m in range(1, 13)])
    db.create_function("halve", 1, lambda x: x / 2)
    got = db.execute("SELECT QUARTER(sold_on), sum(halve(amount)) FROM sales "
                     "GROUP BY 1 ORDER BY 1").fetchall()
    if got != [(1, 30.0), (2, 75.0), (3, 120.0), (4, 165.0)]:
        print(f"quarters: {got!r}", file=sys.stderr)
        failures += 1
    # One connection per thread, each loading the extension.
    results = []

    def work():
        results.append(connect(path).execute("SELECT sysfun_soundex('Robert')").fetchone())

    threads = [threading.Thread(target=work) for _ in range(4)]
    for t in threads:
        t.start()
    for t in threads:
        t.join()
    if results != [("R163",)] * 4:
        print(f"threads: {results!r}", file=sys.stderr)
        failures += 1
    return 1 if failures else 0


if __name__ == "__main__":
    sys.exit(main(sys.argv[1]))
