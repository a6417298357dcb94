# SPDX-License-Identifier: MIT
# What keeps macros apart at the one top level that Ruby has.

module ActiveScript
  # What every macro begins with. Libraries that macros load are added to it: they stay.
  class Baseline
    # Belong to a frame or a thread, or cannot be set, or show something else under another name.
    SPECIAL = /\A\$([~_!@&`'+1-9?$<>.":*=]\z|-[pladFKivw]|FILENAME|KCODE|LOAD|PROGRAM_NAME|VERBOSE)/
    private_constant :SPECIAL

    attr_reader :constants, :methods, :singleton_methods, :globals, :settings, :lists, :features, :locals

    def initialize
      @folder = File.dirname($LOAD_PATH.grep(%r{/ruby/\d[^/]*\z}).first)
      @constants = Object.constants(false).to_h { |name| [name, true] }
      @methods = World.method_names(Object).to_h { |name| [name, true] }
      @singleton_methods = World.method_names(MAIN.singleton_class).to_h { |name| [name, true] }
      @settings = World.settings
      @lists = World::LISTS.map(&:dup)
      @features = $LOADED_FEATURES.to_h { |path| [path, true] }
      @locals = Thread.current.keys
      @globals = {}
      @fixed = {}
      global_variables.each { |name| take_global(name) }
    end

    def fixed?(global) = @fixed.key?(global)

    # Whether the place of a definition is in a library.
    def library?(location) = location.first.start_with?(@folder)

    # A constant of a library in C has no place; a module of a library may have been opened by the macro
    # first.
    def library_constant?(location, value)
      return true if location.empty? || library?(location)
      return false unless Module === value
      methods = World.method_names(value).map { |name| value.instance_method(name) } +
                value.singleton_methods(false).map { |name| value.method(name) }
      methods.any? { |method| method.source_location&.then { |place| library?(place) } }
    end

    private

    def take_global(name)
      raise NameError if SPECIAL.match?(name)
      value = ActiveScript.global(name)
      ActiveScript.set_global(name, value)
      @globals[name] = value
    rescue StandardError
      @fixed[name] = true
    end
  end

  # A macro's share of the top level: its methods, constants, variables and settings. It is in place
  # while the macro runs and put aside when it does not.
  class World
    LISTS = [ARGV, $LOAD_PATH].freeze
    FEATURES = $LOADED_FEATURES

    class << self
      attr_accessor :baseline

      def method_names(owner) = owner.instance_methods(false) + owner.private_instance_methods(false)

      def settings
        { verbose: $VERBOSE, external: Encoding.default_external, internal: Encoding.default_internal,
          deprecated: Warning[:deprecated], experimental: Warning[:experimental], line_number: $.,
          abort: Thread.abort_on_exception, report: Thread.report_on_exception, gc_disabled: false }
      end

      def apply(settings)
        Encoding.default_external = settings[:external]
        Encoding.default_internal = settings[:internal]
        Warning[:deprecated] = settings[:deprecated]
        Warning[:experimental] = settings[:experimental]
        $. = settings[:line_number]
        Thread.abort_on_exception = settings[:abort]
        Thread.report_on_exception = settings[:report]
        settings[:gc_disabled] ? GC.disable : GC.enable
        $VERBOSE = settings[:verbose]
      end
    end

    # The globals are the first ones the macro sees changed.
    def initialize(globals)
      @globals = globals
      @constants = {}
      @methods = []
      @singleton_methods = []
      @variables = {}
      @settings = baseline.settings
      @lists = baseline.lists
      @features = []
      @locals = {}
    end

    def add_variable(name, value) = @variables[name] = value

    def put_aside
      set_trace_func(nil)
      @settings = World.settings.merge(gc_disabled: GC.enable)
      $VERBOSE = nil # redefining is what follows
      take_constants
      @methods = take_methods(Object, baseline.methods)
      @singleton_methods = take_methods(MAIN.singleton_class, baseline.singleton_methods)
      MAIN.instance_variables.each { |name| @variables[name] = MAIN.remove_instance_variable(name) }
      take_globals
      take_lists
      take_locals
      World.apply(baseline.settings)
    end

    def put_back
      $VERBOSE = nil
      @constants.each { |name, value| Object.const_set(name, value) }
      @constants = {}
      give_methods(Object, @methods)
      give_methods(MAIN.singleton_class, @singleton_methods)
      @variables.each { |name, value| MAIN.instance_variable_set(name, value) }
      @variables = {}
      @globals.each { |name, value| ActiveScript.set_global(name, value) }
      LISTS.zip(@lists) { |list, content| list.replace(content) unless list == content }
      FEATURES.concat(@features)
      @locals.each { |name, value| Thread.current[name] = value }
      World.apply(@settings)
    end

    private

    def baseline = World.baseline

    def take_constants
      known = baseline.constants
      Object.constants(false).each do |name|
        next if known.key?(name)
        value = Object.const_get(name) unless Object.autoload?(name)
        next known[name] = true if baseline.library_constant?(Object.const_source_location(name), value)
        @constants[name] = Object.__send__(:remove_const, name)
      end
    end

    def take_methods(owner, known)
      World.method_names(owner).filter_map do |name|
        next if known.key?(name)
        method = owner.instance_method(name)
        location = method.source_location # an alias of a method in C has none
        next known[name] = nil if location && baseline.library?(location)
        entry = [method, visibility(owner, name)]
        owner.__send__(:remove_method, name)
        entry
      end
    end

    def visibility(owner, name)
      return :private if owner.private_method_defined?(name)
      owner.protected_method_defined?(name) ? :protected : :public
    end

    def give_methods(owner, entries)
      entries.each do |method, visibility|
        owner.define_method(method.name, method)
        owner.__send__(visibility, method.name)
      end
    end

    def take_globals
      @globals = {}
      global_variables.each do |name|
        next if baseline.fixed?(name)
        value = ActiveScript.global(name)
        original = baseline.globals[name]
        next if value.equal?(original)
        @globals[name] = value
        untrace_var(name)
        ActiveScript.set_global(name, original)
      end
    end

    # Files of the macro's own are loaded anew by the next one.
    def take_lists
      @lists = LISTS.map(&:dup)
      LISTS.zip(baseline.lists) { |list, content| list.replace(content) unless list == content }
      @features = FEATURES.reject { |path| baseline.features.key?(path) || library_file?(path) }
      FEATURES.replace(FEATURES - @features) unless @features.empty?
    end

    def library_file?(path) = path.include?("/") && baseline.library?([path])

    def take_locals
      @locals = (Thread.current.keys - baseline.locals).to_h { |name| [name, Thread.current[name]] }
      @locals.each_key { |name| Thread.current[name] = nil }
      Thread.current.thread_variables.each { |name| Thread.current.thread_variable_set(name, nil) }
    end
  end

  World.baseline = Baseline.new
end
