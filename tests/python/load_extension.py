"""The SQLite extension from Python's sqlite3 module, as a Python user loads it.

Usage: load_extension.py PATH-OF-THE-EXTENSION
"""
import sqlite3
import sys


def main(path):
    db = sqlite3.connect(":memory:")
    db.enable_load_extension(True)
    db.load_extension(path)
    db.enable_load_extension(False)
    checks = [
        ("SELECT sysfun_left(?, 5) || '|', JULIAN_DAY(?)", ("abc  |", 2452180),
         ("abc", "2001-09-27")),
        ("SELECT sysfun_lcase(?), length(REPEAT('a', 100000))", (b"abc", 100000), (b"ABC",)),
        ("SELECT count(*) > 0 FROM sysfun_functions", (1,)),
    ]
    problems = []
    for sql, expected, *params in checks:
        got = db.execute(sql, *params).fetchone()
        if got != expected:
            problems.append(f"{sql}: got {got!r}, expected {expected!r}")
    # A SYSFUN error reaches Python as sqlite3.OperationalError with its words.
    try:
        db.execute("SELECT JULIAN_DAY('2001-02-29')").fetchone()
        problems.append("JULIAN_DAY('2001-02-29') did not fail")
    except sqlite3.OperationalError as error:
        if "SYSFUN:04" not in str(error):
            problems.append(f"unexpected error: {error}")
    # Python's own functions and ours in one query, over a table.
    db.execute("CREATE TABLE sales (sold_on TEXT, amount REAL)")
    db.executemany("INSERT INTO sales VALUES (?, ?)",
                   [(f"2026-{m:02d}-15", m * 10.0) for m in range(1, 13)])
    db.create_function("halve", 1, lambda x: x / 2)
    got = db.execute("SELECT QUARTER(sold_on), sum(halve(amount)) FROM sales "
                     "GROUP BY 1 ORDER BY 1").fetchall()
    if got != [(1, 30.0), (2, 75.0), (3, 120.0), (4, 165.0)]:
        problems.append(f"quarters: {got!r}")
    for problem in problems:
        print(problem, file=sys.stderr)
    return 1 if problems else 0


if __name__ == "__main__":
    sys.exit(main(sys.argv[1]))
