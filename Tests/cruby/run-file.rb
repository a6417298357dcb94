# SPDX-License-Identifier: MIT
# Runs one file of CRuby's test suite and appends its outcome and that of each test to a log.
# ruby.exe and the engine run this program unchanged. The environment has the folder of the tests
# (CRUBY_TESTS), the file, relative to its folder `test` (CRUBY_TEST_FILES; of several, each run in
# one process takes the next), and the log (CRUBY_TEST_LOG). A test that ends the process leaves the
# outcome "started". Tests that start another Ruby are skipped; with CRUBY_TEST_CHILDREN only these
# run, as the log lists them.

# Bound methods, since tests replace `puts` and the like.
module OutcomeLog
  FILE = File.open(ENV.fetch("CRUBY_TEST_LOG"), "ab")
  NOTE = FILE.method(:syswrite)

  def self.add(test, outcome, error = nil)
    reason = error && " #{error.class}: #{error.message}".b.gsub(/[\x00-\x1f]+/n, " ")[0, 300]
    NOTE.call("#{test}\t#{outcome}#{reason && "\t#{reason}"}\n".b)
  end

  def _start_method(test)
    OutcomeLog.add("#{test.class}##{test.__name__}", "started")
    super
  end

  # Called a second time for an error in teardown.
  def record(suite, name, assertions, time, error)
    outcome = case error
              when nil then "passed"
              when Test::Unit::PendedError then "skipped"
              when Test::Unit::AssertionFailedError then "failed"
              else "error"
              end
    OutcomeLog.add("#{suite}##{name}", outcome, error)
    super
  end
end

STARTS_ANOTHER = "starts another Ruby"
module NoChildren
  def invoke_ruby(*) = raise(Test::Unit::PendedError, STARTS_ANOTHER)
end

tests = ENV.fetch("CRUBY_TESTS")
$LOAD_PATH.unshift("#{tests}/tool/lib")
Warning[:experimental] = false
require "tmpdir" # as other files of the suite would have done
require "test/unit"
require "tracepointchecker"
# It opens each descriptor by its number, which fails at random under Wine.
LeakChecker.class_eval { def check(*) = nil }
Test::Unit::Runner.prepend(OutcomeLog)
log = File.readlines(ENV.fetch("CRUBY_TEST_LOG"))
files = ENV.fetch("CRUBY_TEST_FILES").split
file = files[log.grep(/\A[^#]*\tstarted/).size % files.size]
if ENV["CRUBY_TEST_CHILDREN"]
  skipped = log.grep(/#{STARTS_ANOTHER}/).map { |line| Regexp.escape(line[/[^\t]*/]) }
  names = ["--name=/\\A(?:#{skipped.join("|")})\\z/"]
else
  EnvUtil.singleton_class.prepend(NoChildren)
end
OutcomeLog.add(file, "started")
arguments = ["--test-order=alpha", *names, "#{tests}/test/#{file}"]
Test::Unit::AutoRunner.run(true, "#{tests}/test", arguments)
OutcomeLog.add(file, "passed")
