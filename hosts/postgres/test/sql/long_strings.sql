-- Text longer than terminated text can carry reaches the CLI_udfLob form;
-- a result that would pass 4000 bytes is built by that form too.
\pset null '(null)'
SELECT length(sysfun.repeat('a', 100000)) AS repeated, pg_typeof(sysfun.repeat('a', 100000)) AS type;
SELECT length(sysfun.repeat('ab', 2000)) AS exactly_4000, length(sysfun.repeat('ab', 2001)) AS just_past;
-- An argument of exactly 4000 bytes is still terminated text.
SELECT sysfun.lcase(repeat('A', 4000)) = repeat('a', 4000) AS lowered_4000,
       length(sysfun.rtrim(repeat('c', 3997) || '   ')) AS trimmed_4000,
       sysfun.locate('x', repeat('a', 3999) || 'x') AS found_at_4000, sysfun.soundex(repeat('a', 4000)) AS soundex_4000;
-- Text of the largest size, in and out, also of characters of two bytes.
SELECT length(sysfun.repeat('ab', 524288)) AS repeated_1m, sysfun.lcase(repeat('A', 1048576)) = repeat('a', 1048576) AS lowered_1m,
       sysfun.lcase(repeat('ÄB', 349525)) = repeat('Äb', 349525) AS two_byte_1m;
SELECT length(sysfun.replace(repeat('a', 3000), 'a', 'bb')) AS grown,
       length(sysfun.insert(repeat('a', 3000), 1, 0, repeat('b', 3000))) AS inserted;
SELECT sysfun.locate('needle', repeat('x', 1000000) || 'needle') AS far,
       sysfun.locate('needle', repeat('x', 1000000) || 'needle', 999990) AS from_near;
SELECT length(sysfun.lcase(repeat('A', 5000))) AS lowered, sysfun.ascii(repeat('B', 5000)) AS ascii,
       length(sysfun.rtrim(repeat('c', 5000) || '   ')) AS trimmed;
SELECT length(sysfun.left(repeat('d', 5000), 4500)) AS left_long, length(sysfun.right(repeat('e', 5000), 10)) AS right_long;
-- bytea of any content; the same bytes come back as bytea.
SELECT sysfun.replace('\x00010001'::bytea, '\x01'::bytea, '\x0202'::bytea) AS replaced,
       length(sysfun.repeat('\x00'::bytea, 1048576)) AS at_the_limit, sysfun.lcase(NULL::bytea) AS no_bytes;
-- A long result that cuts a character.
SELECT sysfun.left(repeat('é', 3000), 4001);
\set VERBOSITY sqlstate
-- Past the limits of every form.
SELECT sysfun.repeat('a', 1048577);
SELECT sysfun.lcase(repeat('a', 1048577));
-- A function without a CLI_udfLob form takes 4000 bytes at most.
SELECT sysfun.soundex(repeat('a', 4001));
\set VERBOSITY default
SELECT sysfun.soundex(repeat('a', 4001));
-- By its own name an export takes only its own layout.
SELECT sysfun.repeat1('a', 4001);
SELECT length(sysfun.repeat2('a', 4001)) AS lob_form;
