-- The table functions as set-returning functions with named columns.
\pset null '(null)'
-- FmpThreads: this server's processes; this session is one of them.
SELECT count(*) > 0 AS some, bool_or(pid = pg_backend_pid()) AS this_session
  FROM sysfun.fmpthreads(0);
SELECT pid = pg_backend_pid() AS selected, database_oid = (SELECT oid FROM pg_database WHERE datname = current_database()) AS here
  FROM sysfun.fmpthreads(pg_backend_pid());
SELECT count(*) AS no_such_process FROM sysfun.fmpthreads(-1);
-- FmpRows: the tables of this database.
CREATE TABLE fmp_seen (a int, b text, c int PRIMARY KEY);
SELECT columns, chr(kind) AS kind, chr(persistence) AS persistence, has_index
  FROM sysfun.fmprows() WHERE table_oid = 'fmp_seen'::regclass::oid::int4;
DROP TABLE fmp_seen;
-- SQLCACHE_SNAPSHOT: the snapshot that the test wrote under the server's
-- ORVENGINE_INSTANCE_PATH, and none under a setting that points elsewhere.
SELECT element_554, element_540, element_585_301, section, statement
  FROM sysfun.sqlcache_snapshot() ORDER BY element_554;
SET orvclifn.instance_path = '/nonexistent';
SELECT count(*) AS statements FROM sysfun.sqlcache_snapshot();
-- A statement that is no UTF-8 text (test/run wrote it under broken/)
-- fails the query; the routine is closed, and the next query reads again.
\getenv instance ORVENGINE_INSTANCE_PATH
\set broken :instance '/broken'
SET orvclifn.instance_path = :'broken';
SELECT section, statement FROM sysfun.sqlcache_snapshot();
RESET orvclifn.instance_path;
SELECT count(*) AS statements FROM sysfun.sqlcache_snapshot();
SELECT pg_get_function_result('sysfun.sqlcache_snapshot()'::regprocedure) AS snapshot_columns;
SELECT pg_get_function_result('sysfun.fmpthreads(int4)'::regprocedure) AS thread_columns;
