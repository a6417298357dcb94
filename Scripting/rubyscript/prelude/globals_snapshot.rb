# SPDX-License-Identifier: MIT
# What keeps macros apart at the one top level that Ruby has.

module ActiveScript
  # Where the files of the library are.
  LIBRARY = File.dirname($LOAD_PATH.grep(%r{/ruby/\d[^/]*\z}).first).freeze

  # What every macro begins with. Files of the library that macros load are added to it: they stay.
  class Baseline
    # Belong to a frame or a thread, or cannot be set, or show something else under another name.
    SPECIAL = /\A\$([~_!@&`'+1-9?$<>.":*=]\z|-[pladFKivw]|FILENAME|KCODE|LOAD|PROGRAM_NAME|VERBOSE)/
    private_constant :SPECIAL

    attr_reader :globals, :settings, :lists, :features, :locals

    def initialize
      @settings = GlobalsSnapshot.settings
      @lists = GlobalsSnapshot::LISTS.map(&:dup)
      @features = $LOADED_FEATURES.dup
      @locals = Thread.current.keys
      @globals = {}
      @fixed = {}
      global_variables.each { |name| take_global(name) }
    end

    def fixed?(global) = @fixed.key?(global)
    def fix(global) = @fixed[global] = true

    private

    def take_global(name)
      raise NameError if SPECIAL.match?(name)
      value = ActiveScript.global(name)
      ActiveScript.set_global(name, value)
      @globals[name] = value
    rescue StandardError
      fix(name)
    end
  end

  # Trace points that macros have made. They end with the part of the macro that runs.
  TRACE_POINTS = []
  private_constant :TRACE_POINTS

  module TracePointList
    def new(*)
      point = super
      TRACE_POINTS.push(point)
      point
    end

    def trace(*)
      point = super
      TRACE_POINTS.push(point)
      point
    end

    def self.clear
      TRACE_POINTS.each { |point| point.disable if point.enabled? }
      TRACE_POINTS.clear
    end
  end
  TracePoint.singleton_class.prepend(TracePointList)

  # A macro's share of the top level: an object of its own, and the variables and settings that belong
  # to Ruby as a whole. It is in place while the macro runs and put aside when it does not. Methods and
  # constants are handled natively (ClassSnapshot.h): they are out while this code runs, so Ruby's
  # classes are as they were at the start. Objects that a macro has made may still do anything when
  # they are called. Each step is on its own: one that fails skips no other.
  class GlobalsSnapshot
    LISTS = [ARGV, $LOAD_PATH].freeze
    FEATURES = $LOADED_FEATURES
    COMPILER = RubyVM::InstructionSequence
    EQUAL = BasicObject.instance_method(:equal?)
    private_constant :EQUAL, :COMPILER

    class << self
      attr_accessor :baseline

      def same?(one, other) = EQUAL.bind_call(one, other)

      def settings
        { verbose: $VERBOSE, external: Encoding.default_external, internal: Encoding.default_internal,
          deprecated: Warning[:deprecated], experimental: Warning[:experimental], line_number: $.,
          abort: Thread.abort_on_exception, report: Thread.report_on_exception, gc_disabled: false,
          compile: COMPILER.compile_option, priority: Thread.current.priority }
      end

      # Only what differs: some of these keep memory each time.
      def apply(settings)
        present = self.settings
        Encoding.default_external = settings[:external] unless present[:external].equal?(settings[:external])
        Encoding.default_internal = settings[:internal] unless present[:internal].equal?(settings[:internal])
        Warning[:deprecated] = settings[:deprecated]
        Warning[:experimental] = settings[:experimental]
        $. = settings[:line_number]
        COMPILER.compile_option = settings[:compile] unless present[:compile] == settings[:compile]
        Thread.current.priority = settings[:priority]
        Thread.abort_on_exception = settings[:abort]
        Thread.report_on_exception = settings[:report]
        settings[:gc_disabled] ? GC.disable : GC.enable
        $VERBOSE = settings[:verbose]
      end
    end

    # The globals are the first ones the macro sees changed.
    def initialize(globals)
      @main = MAIN.clone
      @globals = globals
      @settings = baseline.settings
      @lists = baseline.lists
      @features = []
      @locals = {}
      @thread_variables = {}
    end

    attr_reader :main # the top-level object

    def put_aside
      take(:stop_tracing, :take_settings, :take_globals, :take_lists, :take_features, :take_locals)
      GlobalsSnapshot.apply(baseline.settings)
      ActiveScript.top_self = MAIN
    end

    def put_back
      ActiveScript.top_self = @main
      take(:give_globals, :give_lists, :give_locals)
      GlobalsSnapshot.apply(@settings)
    end

    private

    def baseline = GlobalsSnapshot.baseline

    def take(*steps)
      steps.each do |step|
        __send__(step)
      rescue Exception # of an object of the macro
        nil
      end
    end

    def stop_tracing
      GC.stress = false
      set_trace_func(nil)
      Thread.current.set_trace_func(nil)
      TracePointList.clear
    end

    def take_settings
      @settings = GlobalsSnapshot.settings.merge(gc_disabled: GC.enable)
      $VERBOSE = nil
    end

    def give_globals
      $VERBOSE = nil
      @globals.each { |name, value| ActiveScript.set_global(name, value) }
    end

    def give_lists
      LISTS.zip(@lists) { |list, content| replace(list, content) }
      FEATURES.concat(@features)
    end

    def give_locals
      @locals.each { |name, value| Thread.current[name] = value }
      @thread_variables.each { |name, value| Thread.current.thread_variable_set(name, value) }
    end

    # A name that is new may be an alias, as those of the library English are, and what is set by it
    # another variable. So all are read before one is set, and those that everybody has are set last.
    def take_globals
      names = global_variables.reject { |name| baseline.fixed?(name) }
      values = names.to_h { |name| [name, ActiveScript.global(name)] }
      @globals = values.reject { |name, value| GlobalsSnapshot.same?(value, baseline.globals[name]) }
      @globals.keys.each { |name| clear_global(name) unless baseline.globals.key?(name) }
      baseline.globals.each do |name, original|
        untrace_var(name)
        next if GlobalsSnapshot.same?(ActiveScript.global(name), original)
        ActiveScript.set_global(name, original)
      end
    end

    def clear_global(name)
      untrace_var(name)
      ActiveScript.set_global(name, nil)
    rescue NameError, TypeError # an alias of one that takes no such value
      baseline.fix(name)
      @globals.delete(name)
    end

    def take_lists
      @lists = LISTS.map(&:dup)
      LISTS.zip(baseline.lists) { |list, content| replace(list, content) }
    end

    # A new content makes CRuby resolve $LOAD_PATH again.
    def replace(list, content)
      same = list.size == content.size && list.each_index.all? { |i| GlobalsSnapshot.same?(list[i], content[i]) }
      list.replace(content) unless same
    end

    # The macro's own files are loaded again by the next one, those of the library stay.
    def take_features
      known = baseline.features
      return @features = [] if FEATURES.size == known.size && FEATURES.last.equal?(known.last)
      added = FEATURES.reject { |path| known.any? { |each| GlobalsSnapshot.same?(each, path) } }
      library, @features = added.partition { |path| String === path && path.start_with?(LIBRARY) }
      known.concat(library - known)
      FEATURES.replace(known)
    end

    def take_locals
      @locals = (Thread.current.keys - baseline.locals).to_h { |name| [name, Thread.current[name]] }
      @locals.each_key { |name| Thread.current[name] = nil }
      names = Thread.current.thread_variables
      @thread_variables = names.to_h { |name| [name, Thread.current.thread_variable_get(name)] }
      names.each { |name| Thread.current.thread_variable_set(name, nil) }
    end
  end

  GlobalsSnapshot.baseline = Baseline.new
end
