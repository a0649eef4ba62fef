-- Conversions on the way in and out that the other scripts don't reach.
\pset null '(null)'
-- 24:00:00 is 86400 seconds, and the library's 24.00.00.000000 on today's
-- UTC date is the next day's midnight.
SELECT sysfun.midnight_seconds(time '24:00:00') AS seconds,
       sysfun.timestamptime(time '24:00:00') = ((now() AT TIME ZONE 'UTC')::date + 1)::timestamp AS next_midnight;
-- Bytes reach the routine as they are: all 0xFF is no known collation.
SELECT sysfun.collationname('\xffffffffffffffff'::bytea) AS unknown;
-- The argument named is the one too long for terminated text.
SELECT sysfun.difference('Robert', repeat('a', 4001));
-- This session's FmpThreads record: process type 3 (a client backend) and
-- state 2 (running), as PostgreSQL 15 numbers them.
SELECT role_oid = (SELECT oid FROM pg_roles WHERE rolname = current_user)::int4 AS this_role,
       process_type, state,
       started = (SELECT floor(extract(epoch FROM backend_start))::int4 FROM pg_stat_activity
                   WHERE pid = pg_backend_pid()) AS started_then
  FROM sysfun.fmpthreads(pg_backend_pid());
