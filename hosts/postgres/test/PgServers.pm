# Throwaway PostgreSQL servers with the extension, on PostgreSQL's test
# framework: PgServers::start(NAME, LINE...) gives a started node with the
# LINEs in its postgresql.conf.  The extension goes into a private copy of
# the server's installation in a temporary folder; the servers listen on
# Unix sockets only and are stopped when the script ends, also when it dies
# or is interrupted; then the folders go (PG_TEST_NOCLEAN=1 keeps them).
# ORV_BUILD names the build folder, or is --system for the system's own
# installation.  Run by root, the script makes the installation, then goes
# on as the account postgres before the framework starts (initdb refuses root).
#
# In a build with the address sanitizer the module and the libraries are
# instrumented, the server is not: the runtime must be the first object of
# the process, so every server starts with it in LD_PRELOAD, and with
# test/sanitizer_hooks.cpp, without which the runtimes hang the server or
# lose their options.  Leak checking is off: the allocations are the
# server's, let go at exit.  A report goes to a file of its process (the
# undefined-behaviour runtime hands its log_path to the address runtime)
# or to the server's log; each fails the script, see END.
package PgServers;
use strict;
use warnings;
use Cwd qw(abs_path);
use File::Basename qw(basename dirname);
use File::Path qw(make_path);
use File::Temp ();
use POSIX ();

our ($work, $install, $sources, %preload);
BEGIN {
  my $build = $ENV{ORV_BUILD} // die "ORV_BUILD names neither a build folder nor --system\n";
  $build eq '--system' or -f "$build/CMakeCache.txt" or die "no CMakeCache.txt in $build\n";
  my %cache = $build eq '--system' ? () : `cat '$build/CMakeCache.txt'` =~ /^(\w+):\w+=(.*)$/mg;
  my $pg_config = $cache{ORV_PG_CONFIG} // '/usr/lib/postgresql/15/bin/pg_config';
  my %pg = map { $_ => `$pg_config --$_` =~ s/\n//r } qw(bindir sharedir pkglibdir);
  unshift @INC, "$pg{pkglibdir}/pgxs/src/test/perl";
  $ENV{PG_REGRESS} = "$pg{pkglibdir}/pgxs/src/test/regress/pg_regress";
  $sources = abs_path(dirname(__FILE__) . '/../../..');
  $work = File::Temp::tempdir('orvclifn-pg.XXXXXX', TMPDIR => 1, CLEANUP => 1);
  $install = dirname($pg{bindir});
  if (%cache) {
    # The server finds its share and lib folders relative to its program,
    # and initdb and pg_ctl find the server beside them: copies of the three
    # find the extension installed into a tree shaped like the system's.
    # Ours stay also where the system has its own; its other files are linked.
    my $root = "$work/install";
    system("cmake --install '$build' --prefix '$root/usr' --component $_ >/dev/null") == 0
      or die "cmake --install failed\n" for qw(runtime postgres);
    make_path(map { "$root$_" } values %pg);
    system('cp', (map { "$pg{bindir}/$_" } qw(postgres initdb pg_ctl)), "$root$pg{bindir}") == 0
      or die "cannot copy the server's programs\n";
    for my $dir ($pg{bindir}, "$pg{sharedir}/extension", $pg{sharedir}, $pg{pkglibdir}) {
      -e "$root$_" or symlink $_, "$root$_" for glob "$dir/*";
    }
    $install = $root . $install;
    if (($cache{ORV_SANITIZE} // '') =~ /address/) {
      my ($asan) = `ldd '$build/lib/postgresql/orvclifn.so'` =~ /=> (\S*libasan\S*)/
        or die "the sanitized module names no ASan runtime\n";
      mkdir "$work/sanitizer";
      system('cp', "$build/lib/orv_pg_sanitizer_hooks.so", $work) == 0 or die "no hooks\n";
      my $log = "log_path=$work/sanitizer/report";
      %preload = (LD_PRELOAD => "$asan:$work/orv_pg_sanitizer_hooks.so",
        ASAN_OPTIONS => "detect_leaks=0:$log", UBSAN_OPTIONS => "print_stacktrace=1:$log");
    }
  }
  if ($> == 0) {
    my ($uid, $gid) = (getpwnam 'postgres')[2, 3] or die "no account postgres for the servers\n";
    system('chown', '-R', '-h', "$uid:$gid", $work) == 0 or die "chown failed\n";
    $) = "$gid $gid";
    POSIX::setgid($gid);
    POSIX::setuid($uid);
    $< == $uid && $> == $uid or die "cannot become postgres: $!\n";
    @INC = grep { -r } @INC;    # the sources may be where postgres cannot look
  }
  chdir $work or die "$work: $!\n";
  $ENV{TESTDIR} = $work;
}

# Runs after the framework's END blocks, which keep the folders of a failed
# test: large, and seldom looked at (a mutant's run, say).
END { $File::Temp::KEEP_ALL = !!$ENV{PG_TEST_NOCLEAN} }

use PostgreSQL::Test::Cluster;
use PostgreSQL::Test::Utils qw(slurp_file);
use Test::More;

# Stopped by a signal, the script still stops its servers; why it died is
# told beside the framework's output, not only in its log.
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

# Before the framework's END: the servers stop, then every sanitizer report
# is shown and fails the script, none suppressed, so that none of the
# server's hides one of ours (from the runtime's checks of the C library
# and the allocator as the server calls them).  A frame in the module or the
# libraries (by file name, or by a source of this tree) makes it ours.
END {
  my $status = $?;
  $_->stop('immediate', fail_ok => 1) for @nodes;    # also one that a crash stopped
  for my $file (glob("$work/sanitizer/report.*"), grep { -e } map { $_->logfile } @nodes) {
    # From a server log, the runtimes' lines: from one that names a
    # sanitizer or a runtime error to the server's next line of its own.
    my ($text, $on) = ('', $file =~ m{/sanitizer/});
    for (split /^/, slurp_file($file)) {
      $on = 1 if /runtime error:|Sanitizer/;
      $on = 0 if /^\d{4}-\d\d-\d\d /;
      $text .= $_ if $on;
    }
    next if $text eq '';
    $status ||= 1;
    my $ours = $text =~ /orvclifn\.so|libORV(SYS|APP|G11N)64\.so/ || index($text, "$sources/") >= 0;
    my $who = $ours ? 'the module or the library' : "PostgreSQL's own code: no frame of ours";
    diag('sanitizer report in ' . basename($file) . ", from $who:\n$text");
  }
  $? = $status;
}

1;
