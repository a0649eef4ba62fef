# Throwaway PostgreSQL servers with the extension, on PostgreSQL's own test
# framework (PostgreSQL::Test::Cluster), for the tests and the demos.
# Nothing here touches the system's own PostgreSQL: the extension is
# installed into a private copy of the server's installation in a temporary
# folder, every server listens on a Unix socket in a temporary folder only,
# and all are stopped when the script ends, also when it dies or is
# interrupted; then the folders are removed (kept with PG_TEST_NOCLEAN=1).
#
# ORV_BUILD names the build folder, or is --system: the system's own
# installation as it is, where the extension's package is installed.  A
# script run by root makes the installation, then goes on as the account
# postgres before the framework starts (initdb and the server refuse root).
#
#   PgServers::start(NAME, LINE...)  initdb a server, add LINEs to its
#                                    postgresql.conf, start it; its node
#
# A build with the address sanitizer has the module, the library and the
# service libraries instrumented; the server is not.  The runtime must be
# the first object of a process that loads an instrumented one, so every
# server starts with it in LD_PRELOAD, inherited by each backend; with it
# test/sanitizer_hooks.cpp, without which the runtimes hang the server or
# lose their options.  Leak checking is off: the processes' allocations are
# the server's, let go when they exit.  Both runtimes write a report to a
# file of its process (the same log_path for both: the undefined-behaviour
# runtime hands its own to the address runtime, whose functions come
# first); the runtimes' lines in a server's log count too.  Any report
# fails the script, see END.
package PgServers;
use strict;
use warnings;
use Cwd qw(abs_path);
use File::Basename qw(basename dirname);
use File::Copy qw(cp);
use File::Path qw(make_path);
use File::Temp ();
use POSIX ();

our ($work, $install, $sources, %preload);
BEGIN {
  my $build = $ENV{ORV_BUILD} // die "ORV_BUILD names neither a build folder nor --system\n";
  my %cache;
  if ($build ne '--system') {
    $build = abs_path($build);
    open my $f, '<', "$build/CMakeCache.txt" or die "no CMakeCache.txt in $ENV{ORV_BUILD}\n";
    /^(\w+):\w+=(.*)$/ and $cache{$1} = $2 while <$f>;
  }
  my $pg_config = $cache{ORV_PG_CONFIG} // '/usr/lib/postgresql/15/bin/pg_config';
  my %pg = map { $_ => `$pg_config --$_` =~ s/\n//r } qw(bindir sharedir pkglibdir);
  unshift @INC, "$pg{pkglibdir}/pgxs/src/test/perl";
  $ENV{PG_REGRESS} = "$pg{pkglibdir}/pgxs/src/test/regress/pg_regress";
  $sources = abs_path(dirname(__FILE__) . '/../../..');
  $work = File::Temp::tempdir('orvclifn-pg.XXXXXX', TMPDIR => 1, CLEANUP => 1);
  chmod 0755, $work;
  $install = dirname($pg{bindir});
  if (%cache) {
    # The server finds its share and lib folders relative to its program,
    # and initdb and pg_ctl find the server beside them: copies of the
    # three in a tree shaped like the system's find the extension installed
    # there.  Ours stay also where the system has its own; the system's
    # other files are linked.
    my $root = "$work/install";
    for my $part (qw(runtime postgres)) {
      system("cmake --install '$build' --prefix '$root/usr' --component $part >/dev/null") == 0
        or die "cmake --install failed\n";
    }
    make_path("$root$pg{bindir}");
    system('cp', (map { "$pg{bindir}/$_" } qw(postgres initdb pg_ctl)), "$root$pg{bindir}") == 0
      or die "cannot copy the server's programs\n";
    for my $dir ($pg{bindir}, "$pg{sharedir}/extension", $pg{sharedir}, $pg{pkglibdir}) {
      make_path("$root$dir");
      -e "$root$_" or symlink $_, "$root$_" for glob "$dir/*";
    }
    $install = "$root" . dirname($pg{bindir});
    if (($cache{ORV_SANITIZE} // '') =~ /address/) {
      # The runtime that the module was linked with.
      my ($asan) = `ldd $build/lib/postgresql/orvclifn.so` =~ /^\s*libasan\.so\S*\s+=>\s+(\S+)/m
        or die "the sanitized module names no ASan runtime\n";
      cp("$build/lib/orv_pg_sanitizer_hooks.so", $work) or die "sanitizer hooks: $!\n";
      mkdir "$work/sanitizer";
      my $log = "log_path=$work/sanitizer/report";
      %preload = (LD_PRELOAD => "$asan:$work/orv_pg_sanitizer_hooks.so",
                  ASAN_OPTIONS => "detect_leaks=0:$log", UBSAN_OPTIONS => "print_stacktrace=1:$log");
    }
  }
  if ($> == 0) {
    my ($uid, $gid) = (getpwnam 'postgres')[2, 3];
    defined $uid or die "there is no account postgres to run the servers\n";
    system('chown', '-R', '-h', "$uid:$gid", $work) == 0 or die "chown failed\n";
    $) = "$gid $gid";
    POSIX::setgid($gid);
    POSIX::setuid($uid);
    $< == $uid && $> == $uid or die "cannot become postgres: $!\n";
  }
  chdir $work or die "$work: $!\n";
  $ENV{TESTDIR} = $work;
}

# Runs after the framework's END blocks, which keep the folders when a test
# failed: the servers' installation is large, and most runs that fail
# (mutants, say) need no look at them.
END { $File::Temp::KEEP_ALL = !!$ENV{PG_TEST_NOCLEAN} }

use PostgreSQL::Test::Cluster;
use PostgreSQL::Test::Utils qw(slurp_file);
use Test::More;

# Stopped by a signal, the script still stops its servers.  Why it died
# is told also where the framework's own output goes, beside its log.
$SIG{$_} = sub { die "stopped by SIG$_[0]\n" } for qw(INT TERM HUP);
$SIG{__DIE__} = sub { diag(@_) unless $^S };

my @nodes;
sub start {
  my ($name, @lines) = @_;
  my $node = PostgreSQL::Test::Cluster->new($name, install_path => $install);
  $node->init(extra => ['--encoding=UTF8', '--locale=C.UTF-8']);
  $node->append_conf('postgresql.conf', join "\n", 'max_parallel_workers_per_gather = 2', @lines);
  push @nodes, $node;
  local %ENV = (%ENV, %preload);
  $node->start(fail_ok => 1) or BAIL_OUT("$name did not start:\n" . slurp_file($node->logfile));
  return $node;
}

# Before the framework's own: the servers are stopped, then every sanitizer
# report is shown, and each fails the script.  PostgreSQL's code is not
# instrumented, so a report comes from our objects, or from the address
# runtime's checks of the C library's and the allocator's functions as the
# server calls them.  None is suppressed, so none of the server's can hide
# one of ours; the label tells them apart by the frames: one in the module,
# the library or the service libraries (by file name, or by a source of
# this tree) makes it ours.
END {
  my $status = $?;
  $_->stop('immediate', fail_ok => 1) for @nodes;    # also one that a crash stopped
  for my $file (glob("$work/sanitizer/report.*"), map { $_->logfile } @nodes) {
    open my $f, '<', $file or next;
    my ($text, $on) = ('');
    if ($file =~ m{/sanitizer/}) { local $/; $text = <$f> }
    # From a server log, the runtimes' lines: from one that names a
    # sanitizer or a runtime error to the server's next line of its own.
    else {
      while (<$f>) {
        $on = 1 if /runtime error:|Sanitizer/;
        $on = 0 if /^\d{4}-\d\d-\d\d /;
        $text .= $_ if $on;
      }
    }
    next if $text eq '';
    $status ||= 1;
    my $who = $text =~ /orvclifn\.so|liborvclifn\.so|libORV(SYS|APP|G11N)64\.so/
      || index($text, "$sources/") >= 0 ? 'the module or the library'
      : "PostgreSQL's own code: no frame of ours";
    diag('sanitizer report in ' . basename($file) . ", from $who:\n$text");
  }
  $? = $status;
}

1;
