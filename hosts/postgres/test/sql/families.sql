-- Every family of routines through SQL, with the errors they report.
\pset null '(null)'
-- An error as its SQLSTATE and message, so that the expected output
-- shows both.
CREATE FUNCTION pg_temp.outcome(query text) RETURNS text LANGUAGE plpgsql AS $$
DECLARE result text;
BEGIN
  EXECUTE query INTO result;
  RETURN coalesce(result, '(null)');
EXCEPTION WHEN OTHERS THEN
  RETURN SQLSTATE || ' ' || SQLERRM;
END $$;

-- Day and second counts, weeks, numbers and names in a date.
SELECT sysfun.julian_day('2001-09-27') AS julian,
       sysfun.julian_day('2001-09-27-13.30.15.000000') AS from_stamp,
       sysfun.midnight_seconds('13.30.15') AS seconds,
       sysfun.midnight_seconds('24.00.00') AS midnight,
       sysfun.week('2005-01-01') AS week, sysfun.week_iso('2005-01-01') AS iso_week,
       sysfun.quarter('2026-11-24') AS quarter, sysfun.dayofyear('2024-12-31') AS doy,
       sysfun.dayofweek('2026-11-24') AS dow, sysfun.dayofweek_iso('2026-11-22') AS iso_dow;
SELECT sysfun.dayname('2026-11-24') AS day, sysfun.monthname('2026-02-01') AS month;
SELECT sysfun.timestampdate('2001-09-27') AS stamp_text,
       sysfun.timestampdiff(16, '00000100000000.000000') AS days_in_a_month,
       sysfun.timestampdiff(2, '00000000000001.500000') AS seconds;
-- The export that reads the date at the head only, by its own name.
SELECT sysfun.julian_day1('2001-09-27 and more') AS head_only;
SELECT pg_temp.outcome($$SELECT sysfun.julian_day('2001-09-27 and more')::text$$);
SELECT pg_temp.outcome($$SELECT sysfun.julian_day('2001-02-29')::text$$);
SELECT pg_temp.outcome($$SELECT sysfun.midnight_seconds('25.00.00')::text$$);
SELECT pg_temp.outcome($$SELECT sysfun.timestampdiff(16, '0000010000000x.000000')::text$$);
SELECT pg_temp.outcome($$SELECT sysfun.timestampdiff(17, '00000100000000.000000')::text$$);

-- Numbers, one export per type.
SELECT sysfun.abs(-2.5) AS real, sysfun.abs(-7) AS int4, sysfun.abs(-7::int2) AS int2,
       sysfun.abs(-7::int8) AS int8, sysfun.sign(-0.0::float8) AS sign,
       sysfun.mod(-7, 3) AS mod, sysfun.ceiling(2.5) AS ceiling, sysfun.floor(-2.5) AS floor;
SELECT sysfun.round(2.345, 2) AS round, sysfun.round(1234, -2) AS round_int,
       sysfun.round(123456789012::int8, -3) AS round_int8, sysfun.truncate(-2.345, 1) AS truncate;
SELECT sysfun.power(2, 10) AS int4, sysfun.power(2.0, 0.5) AS real, sysfun.power(2.0, -1) AS whole,
       sysfun.power(3::int8, 39::int8) AS int8;
SELECT sysfun.sqrt(2) AS sqrt, sysfun.log10(1000) AS log10, sysfun.exp(1) AS e,
       sysfun.atan2(1, 1) AS atan2, sysfun.degrees(pi()) AS degrees, sysfun.cot(1) AS cot;
SELECT sysfun.chartodouble('1.5e3  ') AS number, sysfun.doubletochar(1.5) || '|' AS text;
SELECT sysfun.rand(7) = sysfun.rand(7) AS first_of_a_seed, sysfun.rand() BETWEEN 0 AND 1 AS in_range;
SELECT pg_temp.outcome($$SELECT sysfun.abs(-2147483648)::text$$);
SELECT pg_temp.outcome($$SELECT sysfun.mod(1::int2, 0::int2)::text$$);
SELECT pg_temp.outcome($$SELECT sysfun.mod(1, 0)::text$$);
SELECT pg_temp.outcome($$SELECT sysfun.sqrt(-1)::text$$);
SELECT pg_temp.outcome($$SELECT sysfun.power(10, 10)::text$$);
SELECT pg_temp.outcome($$SELECT sysfun.chartodouble('1.5x')::text$$);

-- Strings: bytes, blanks and limits.
SELECT sysfun.space(3) || '|' AS space, sysfun.lcase('ÄBC') AS lcase,
       sysfun.rtrim(E'ab \t ') || '|' AS rtrim, '|' || sysfun.ltrim(E' \tab') AS ltrim,
       sysfun.left('abc', 5) || '|' AS "left", sysfun.right('abc', 2) AS "right",
       sysfun.repeat('ab', 3) AS "repeat", sysfun."char"(65) AS "char", sysfun.ascii('A') AS ascii;
SELECT sysfun.locate('b', 'abcb') AS locate, sysfun.locate('b', 'abcb', 3) AS from_3,
       sysfun.replace('banana', 'an', 'AN') AS "replace", sysfun.insert('abcdef', 2, 3, 'XY') AS "insert";
SELECT sysfun.soundex('Robert') AS soundex, sysfun.soundex('Tymczak') AS tymczak,
       sysfun.difference('Robert', 'Rupert') AS difference;
SELECT pg_temp.outcome($$SELECT sysfun.space(4001)$$);
SELECT pg_temp.outcome($$SELECT sysfun.left('abc', -1)$$);
SELECT pg_temp.outcome($$SELECT sysfun.locate('b', 'abc', 0)::text$$);
-- A result that cuts a character is no text of the database.
SELECT pg_temp.outcome($$SELECT sysfun.left('é', 1)$$);
SELECT sysfun.left(convert_to('é', 'UTF8'), 1) AS bytes;

-- The engine-bound scalar routines.
SELECT sysfun.collationname('\x0000000000000000'::bytea) AS collation,
       sysfun.collationname(NULL) AS of_null;
SELECT pg_temp.outcome($$SELECT sysfun.collationname('\x00'::bytea)$$);
SELECT sysfun.veblob_cp_large(NULL, 1208, 1208, 0) AS null_object;
-- A record converted from UTF-8 to Latin-1: the head as it was, the
-- length field rewritten.  A tag that is not known, and a string that may
-- not fit the 500000 bytes of VEBLOB_CP_SMALL when it doubles, are statuses
-- of their own.
SELECT sysfun.veblob_cp_large(decode(repeat('ab', 22) || '4b02c3a9', 'hex'), 1208, 819, 0) AS converted;
SELECT pg_temp.outcome($$SELECT sysfun.veblob_cp_large(decode(repeat('ab', 22) || '00', 'hex'), 1208, 819, 0)::text$$);
CREATE TEMP TABLE big_object AS
  SELECT decode(repeat('ab', 22) || 'cb801a0600', 'hex') || convert_to(repeat('a', 400000), 'UTF8') AS o;
SELECT sysfun.veblob_cp_large(o, 1208, 819, 0) = o AS large_unchanged FROM big_object;
SELECT pg_temp.outcome($$SELECT sysfun.veblob_cp_small(o, 1208, 819, 0)::text FROM big_object$$);

-- DAYNAME and MONTHNAME tell the library the code page of the database's
-- encoding, and refuse an encoding that has none.
\set regression :DBNAME
CREATE DATABASE orvclifn_latin2 ENCODING 'LATIN2' LOCALE 'C' TEMPLATE template0;
\c orvclifn_latin2
CREATE EXTENSION orvclifn;
SELECT sysfun.dayname('2026-11-24');
\c :regression
DROP DATABASE orvclifn_latin2;
