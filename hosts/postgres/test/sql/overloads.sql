-- PostgreSQL picks the function by the argument types; each type reaches
-- the export of its width, and the functions give their own types back.
\pset null '(null)'
SELECT pg_typeof(sysfun.abs(1::int2)) AS int2, pg_typeof(sysfun.abs(1)) AS int4,
       pg_typeof(sysfun.abs(1::int8)) AS int8, pg_typeof(sysfun.abs(1.5)) AS numeric_literal,
       pg_typeof(sysfun.abs(1::float4)) AS float4;
-- The plain name and the export's own name agree on every numeric form.
SELECT sysfun.abs(-3::int2) = sysfun.abs3(-3::int2) AS abs3,
       sysfun.abs(-3) = sysfun.abs2(-3) AS abs2,
       sysfun.abs(-3::int8) = sysfun.abs4(-3::int8) AS abs4,
       sysfun.abs(-3.5::float8) = sysfun.abs1(-3.5) AS abs1,
       sysfun.mod(7::int2, 4::int2) = sysfun.mod2(7::int2, 4::int2) AS mod2,
       sysfun.mod(7::int8, 4::int8) = sysfun.mod3(7::int8, 4::int8) AS mod3,
       sysfun.round(1.25, 1) = sysfun.round1(1.25, 1) AS round1,
       sysfun.round(125::int8, -1) = sysfun.round5(125::int8, -1) AS round5,
       sysfun.power(2.0, 3) = sysfun.power2(2.0, 3) AS power2;
SELECT pg_typeof(sysfun.round(1::int2, 0)) AS int2_rounds_as, pg_typeof(sysfun.power(2, 3)) AS power_int4,
       pg_typeof(sysfun.power(2::int8, 3::int8)) AS power_int8;
-- The 16-bit and 64-bit forms keep to their range.
SELECT sysfun.abs(-32767::int2) AS int2_max, sysfun.abs(-9223372036854775807) AS int8_max;
-- varchar is text; bytea reaches the CLI_udfLob form and gives bytea back.
SELECT pg_typeof(sysfun.lcase('A'::varchar(10))) AS from_varchar,
       pg_typeof(sysfun.lcase('\x41'::bytea)) AS from_bytea, sysfun.lcase('\x41'::bytea) AS lowered,
       sysfun.locate('\x00'::bytea, '\x410042'::bytea) AS nul_found;
-- Dates, timestamps and times are turned into the library's text forms.
SELECT sysfun.julian_day(date '2001-09-27') AS date, sysfun.julian_day(timestamp '2001-09-27 23:59:59') AS stamp,
       sysfun.dayofweek(timestamptz '2026-11-24 00:30:00+00') AS in_session_zone,
       sysfun.midnight_seconds(time '13:30:15.75') AS time_of_day,
       sysfun.midnight_seconds(timestamp '2001-09-27 01:02:03') AS of_stamp;
SELECT sysfun.timestamp(date '2001-09-27') AS from_date, pg_typeof(sysfun.timestamp(date '2001-09-27')) AS type,
       sysfun.timestamp(timestamp '0001-01-01 00:00:00.000001') AS earliest,
       sysfun.timestamp(timestamp '9999-12-31 23:59:59.999999') AS latest,
       sysfun.timestampdate(date '2024-02-29') AS date_at_midnight,
       sysfun.timestamp('2001-09-27') AS from_text, pg_typeof(sysfun.timestamp('2001-09-27')) AS text_type;
SELECT sysfun.timestamptime(time '10:00:00')::date = (now() AT TIME ZONE 'UTC')::date AS today_in_utc;
-- Outside the years 1 to 9999 there is no text form.
SELECT sysfun.julian_day(date '0001-01-01') AS first_day, sysfun.julian_day(date '9999-12-31') AS last_day;
\set VERBOSITY sqlstate
SELECT sysfun.julian_day(date '10000-01-01');
SELECT sysfun.julian_day(date '0001-12-31 BC');
SELECT sysfun.julian_day('infinity'::date);
SELECT sysfun.julian_day('2001-02-29');
SELECT sysfun.mod(1.5, 1);
\set VERBOSITY default
-- NULL: the functions that don't read their indicators are STRICT.
SELECT sysfun.abs(NULL::int4) AS abs, sysfun.repeat(NULL, 3) AS repeat, sysfun.locate('a', NULL) AS locate,
       sysfun.julian_day(NULL::date) AS julian_day;
SELECT p.proname, p.provolatile, p.proisstrict, p.proparallel
  FROM pg_proc p JOIN pg_namespace n ON n.oid = p.pronamespace
 WHERE n.nspname = 'sysfun' AND p.proname IN ('rand', 'abs', 'dayname', 'timestamp', 'collationname', 'sqlcache_snapshot')
 ORDER BY 1, pg_get_function_identity_arguments(p.oid);
-- Every function of the schema, once: as many as the catalogue implies.
SELECT count(*) AS functions, count(DISTINCT proname) AS names
  FROM pg_proc p JOIN pg_namespace n ON n.oid = p.pronamespace WHERE n.nspname = 'sysfun';
