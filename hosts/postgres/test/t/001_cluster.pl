# The extension across servers: a coordinator whose table `sales` is
# hash-partitioned on id into two foreign tables, one on each of two
# shards, joined by postgres_fdw with the extension declared shippable.
# Queries that filter and group by the library's functions must have the
# filters computed on the shards (in each shard's Remote SQL; postgres_fdw
# ships a whole aggregate only when it groups by the partition key), and
# must give exactly what they give on a single server with all the rows.
# ORV_BUILD names the build folder (test/PgServers.pm); with ORV_PG_WAIT=1
# the servers stay up after the checks, until Enter or Ctrl-C.
use strict;
use warnings;
use FindBin;
use lib "$FindBin::RealBin/..";
use PgServers;
use Test::More;

my ($rows, @shards) = (100000, map { PgServers::start($_) } qw(shard0 shard1));
my ($coordinator, $single) = map { PgServers::start($_) } qw(coordinator single);
sub sql { my ($node, $sql) = @_; return $node->safe_psql('postgres', $sql) }
sql($_, 'CREATE EXTENSION orvclifn') for @shards, $coordinator, $single;

# The sales: deterministic rows over five years, customers from a list in
# which several names share a Soundex code, amounts exact to the cent.
my $columns = 'id bigint NOT NULL, sold_on date NOT NULL, customer text NOT NULL, '
  . 'amount numeric(12,2) NOT NULL';
my $generate = "SELECT i, date '2019-01-01' + ((i * 7919) % 1826)::int,
  (ARRAY['Smith', 'Smyth', 'Schmidt', 'Robert', 'Rupert', 'Rubin', 'Ashcraft',
         'Ashcroft', 'Tymczak', 'Pfister', 'Lee', 'Li', 'Gutierrez', 'Jackson',
         'Jaxon', 'Washington', 'Honeyman', 'Lloyd', 'Lewis', 'Louis'])[1 + (i * 31) % 20],
  ((i * 104729) % 100000) / 100.0
  FROM generate_series(1::bigint, $rows) AS i";
sql($_, "CREATE TABLE sales ($columns, PRIMARY KEY (id))") for @shards, $single;
sql($single, "INSERT INTO sales $generate; ANALYZE sales");

# The coordinator holds no rows: each partition is the shard's table, and
# the rows inserted here are routed by the hash of id to their shard.
my $setup = "CREATE EXTENSION postgres_fdw; CREATE TABLE sales ($columns) PARTITION BY HASH (id);";
for my $i (0 .. $#shards) {
  $setup .= "CREATE SERVER shard$i FOREIGN DATA WRAPPER postgres_fdw OPTIONS (host '"
    . $shards[$i]->host . "', port '" . $shards[$i]->port . "', dbname 'postgres',
      extensions 'orvclifn', batch_size '1000');
    CREATE USER MAPPING FOR CURRENT_USER SERVER shard$i;
    CREATE FOREIGN TABLE sales_$i PARTITION OF sales FOR VALUES WITH (MODULUS 2, REMAINDER $i)
      SERVER shard$i OPTIONS (table_name 'sales');";
}
sql($coordinator, "$setup INSERT INTO sales $generate;
  ALTER DATABASE postgres SET enable_partitionwise_aggregate = on;");
sql($_, 'ANALYZE sales') for @shards, $coordinator;

# Each shard has rows, they add up to all of them, and each holds only the
# rows of its partition (checked on the coordinator, behind OFFSET 0 so
# that the check is not itself sent to the shard).
my $total = 0;
for my $i (0 .. $#shards) {
  my $count = sql($shards[$i], 'SELECT count(*) FROM sales');
  cmp_ok($count, '>', 0, "shard$i holds rows: $count");
  is(sql($coordinator, "SELECT count(*) FROM (SELECT id FROM sales_$i OFFSET 0) AS s
       WHERE NOT satisfies_hash_partition('sales'::regclass, 2, $i, id)"),
    0, "shard$i holds only the rows of its partition");
  $total += $count;
}
is($total, $rows, 'the shards hold every row');
my $digest = "SELECT count(*), sum(amount), md5(string_agg(concat_ws(',', id, sold_on, customer,
  amount), ';' ORDER BY id)) FROM sales";
is(sql($coordinator, $digest), sql($single, $digest), "the coordinator has the single's rows");

# The queries, each after the functions that its filter uses: these must be
# computed by every shard, so they must appear in every Remote SQL.
my @queries = (
  ['quarter', "SELECT sysfun.dayofweek_iso(sold_on) AS dow, count(*), sum(amount)
     FROM sales WHERE sysfun.quarter(sold_on) = 2 GROUP BY 1 ORDER BY 1"],
  ['dayofweek', "SELECT sysfun.soundex(customer) AS code, count(*), sum(amount),
          string_agg(DISTINCT customer, ',' ORDER BY customer) AS names
     FROM sales WHERE sysfun.dayofweek(sold_on) IN (1, 7) GROUP BY 1 ORDER BY 1"],
  ['julian_day week_iso', "SELECT sysfun.week_iso(sold_on) AS week, count(*), sum(amount),
          min(sold_on), max(sold_on) FROM sales
    WHERE sysfun.julian_day(sold_on) BETWEEN sysfun.julian_day(date '2021-01-01')
                                         AND sysfun.julian_day(date '2021-03-31')
      AND sysfun.week_iso(sold_on) BETWEEN 1 AND 8 GROUP BY 1 ORDER BY 1"],
  ['soundex dayofweek_iso week_iso', "SELECT id, sold_on, sysfun.dayname(sold_on) AS day,
          customer, amount FROM sales WHERE sysfun.soundex(customer) = sysfun.soundex('Smith')
      AND sysfun.dayofweek_iso(sold_on) = 5 AND sysfun.week_iso(sold_on) >= 50 ORDER BY id"]);
for my $i (1 .. @queries) {
  my ($shipped, $query) = @{ $queries[$i - 1] };
  my $plan = sql($coordinator, "EXPLAIN (VERBOSE, COSTS OFF) $query");
  my @remote = map { /^\s*(Remote SQL:.*)/ } split /\n/, $plan;
  note("query $i:\n$query\n", map { "  $_\n" } @remote);
  is(scalar @remote, scalar @shards, "query $i: one Remote SQL per shard") or diag($plan);
  for my $function (split ' ', $shipped) {
    ok(!grep({ !/sysfun\.$function\(/ } @remote), "query $i: $function computed on every shard")
      or diag($plan);
  }
  # What else the query calls is computed on the coordinator: a GROUP BY
  # that does not hold the partition key is aggregated there.
  my %seen = map { $_ => 1 } "@remote" =~ /sysfun\.\w+/g;
  my @local = grep { !$seen{$_}++ } $query =~ /sysfun\.\w+/g;
  note("  (on the coordinator: @local)") if @local;
  my $on_single = sql($single, $query);
  isnt($on_single, '', "query $i selects rows, or it proves nothing");
  is(sql($coordinator, $query), $on_single, "query $i: the same "
    . (1 + ($on_single =~ tr/\n//)) . ' rows on the cluster as on the single server');
}

if ($ENV{ORV_PG_WAIT}) {
  diag('The servers run until Enter or Ctrl-C (database postgres, no password):');
  diag(sprintf '  %-12s psql -h %s -p %d -U %s', $_->name . ':', $_->host, $_->port,
    scalar getpwuid $>) for $coordinator, @shards, $single;
  diag("Try, on the coordinator:\n  EXPLAIN (VERBOSE, COSTS OFF) "
    . ($queries[0][1] =~ s/\s+/ /gr) . ';');
  readline STDIN;
}
done_testing();
