# SPDX-License-Identifier: MIT
# What keeps macros apart at the one top level that Ruby has.

module ActiveScript
  # What every macro begins with. Libraries that macros load are added to it: they stay.
  class Baseline
    # Belong to a frame or a thread, or cannot be set, or show something else under another name.
    SPECIAL = /\A\$([~_!@&`'+1-9?$<>.":*=]\z|-[pladFKivw]|FILENAME|KCODE|LOAD|PROGRAM_NAME|VERBOSE)/
    private_constant :SPECIAL

    attr_reader :constants, :methods, :globals, :settings, :lists, :features, :locals

    def initialize
      @folder = File.dirname($LOAD_PATH.grep(%r{/ruby/\d[^/]*\z}).first)
      @constants = Object.constants(false).to_h { |name| [name, GlobalsSnapshot.constant(name)] }
      @methods = GlobalsSnapshot.method_names(Object).to_h { |name| [name, true] }
      @settings = GlobalsSnapshot.settings
      @lists = GlobalsSnapshot::LISTS.map(&:dup)
      @features = $LOADED_FEATURES.to_h { |path| [path, true] }
      @locals = Thread.current.keys
      @globals = {}
      @fixed = {}
      global_variables.each { |name| take_global(name) }
    end

    def fixed?(global) = @fixed.key?(global)
    def fix(global) = @fixed[global] = true

    # Whether the place of a definition is in a library.
    def library?(location) = location.first.start_with?(@folder)

    # A constant of a library in C has no place; a module of a library may have been opened by the macro
    # first.
    def library_constant?(location, value)
      return true if location.empty? || library?(location)
      return false unless Module === value
      methods = GlobalsSnapshot.method_names(value).map { |name| value.instance_method(name) } +
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
      fix(name)
    end
  end

  # A macro's share of the top level: an object of its own and the methods, constants, variables and
  # settings that belong to Ruby as a whole. It is in place while the macro runs and put aside when it
  # does not.
  class GlobalsSnapshot
    LISTS = [ARGV, $LOAD_PATH].freeze
    FEATURES = $LOADED_FEATURES

    class << self
      attr_accessor :baseline

      def method_names(owner) = owner.instance_methods(false) + owner.private_instance_methods(false)

      # nil for one that is still to be loaded.
      def constant(name) = Object.autoload?(name) ? nil : Object.const_get(name)

      def settings
        { verbose: $VERBOSE, external: Encoding.default_external, internal: Encoding.default_internal,
          deprecated: Warning[:deprecated], experimental: Warning[:experimental], line_number: $.,
          abort: Thread.abort_on_exception, report: Thread.report_on_exception, gc_disabled: false }
      end

      # Only what differs: some of these keep memory each time.
      def apply(settings)
        present = self.settings
        Encoding.default_external = settings[:external] unless present[:external].equal?(settings[:external])
        Encoding.default_internal = settings[:internal] unless present[:internal].equal?(settings[:internal])
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
      @main = MAIN.clone
      @globals = globals
      @constants = {}
      @autoloads = {}
      @methods = []
      @settings = baseline.settings
      @lists = baseline.lists
      @features = []
      @locals = {}
      @thread_variables = {}
    end

    attr_reader :main # the top-level object

    def put_aside
      GC.stress = false
      set_trace_func(nil)
      @settings = GlobalsSnapshot.settings.merge(gc_disabled: GC.enable)
      $VERBOSE = nil # redefining is what follows
      take_constants
      take_methods
      take_globals
      take_lists
      take_locals
      GlobalsSnapshot.apply(baseline.settings)
      ActiveScript.top_self = MAIN
    end

    def put_back
      ActiveScript.top_self = @main
      $VERBOSE = nil
      @constants.each { |name, value| Object.const_set(name, value) }
      @constants = {}
      @autoloads.each { |name, path| Object.autoload(name, path) }
      @autoloads = {}
      give_methods
      @globals.each { |name, value| ActiveScript.set_global(name, value) }
      LISTS.zip(@lists) { |list, content| list.replace(content) unless list == content }
      FEATURES.concat(@features)
      @locals.each { |name, value| Thread.current[name] = value }
      @thread_variables.each { |name, value| Thread.current.thread_variable_set(name, value) }
      GlobalsSnapshot.apply(@settings)
    end

    private

    def baseline = GlobalsSnapshot.baseline

    def take_constants
      known = baseline.constants
      Object.constants(false).each do |name|
        value = GlobalsSnapshot.constant(name)
        next restore_constant(name, value, known) if known.key?(name)
        path = Object.autoload?(name)
        next @autoloads[name] = path.tap { Object.__send__(:remove_const, name) } if path
        next known[name] = value if baseline.library_constant?(Object.const_source_location(name), value)
        @constants[name] = Object.__send__(:remove_const, name)
      end
    end

    # One that everybody has may have been loaded by now, or been given another value by the macro.
    def restore_constant(name, value, known)
      original = known[name]
      return known[name] = value if original.nil?
      return if value.equal?(original)
      Object.__send__(:remove_const, name)
      Object.const_set(name, original)
    end

    def take_methods
      @methods = GlobalsSnapshot.method_names(Object).filter_map do |name|
        next if baseline.methods.key?(name)
        method = Object.instance_method(name)
        location = method.source_location # an alias of a method in C has none
        if location && baseline.library?(location)
          baseline.methods[name] = true
          next
        end
        entry = [method, visibility(name)]
        Object.__send__(:remove_method, name)
        entry
      end
    end

    def visibility(name)
      return :private if Object.private_method_defined?(name)
      Object.protected_method_defined?(name) ? :protected : :public
    end

    def give_methods
      @methods.each do |method, visibility|
        Object.define_method(method.name, method)
        Object.__send__(visibility, method.name)
      end
    end

    # A name that is new may be an alias, as those of the library English are, and what is set by it
    # another variable. So all are read before one is set, and those that everybody has are set last.
    def take_globals
      names = global_variables.reject { |name| baseline.fixed?(name) }
      values = names.to_h { |name| [name, ActiveScript.global(name)] }
      @globals = values.reject { |name, value| value.equal?(baseline.globals[name]) }
      @globals.keys.each { |name| clear_global(name) unless baseline.globals.key?(name) }
      baseline.globals.each do |name, original|
        next if ActiveScript.global(name).equal?(original)
        untrace_var(name)
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
      names = Thread.current.thread_variables
      @thread_variables = names.to_h { |name| [name, Thread.current.thread_variable_get(name)] }
      names.each { |name| Thread.current.thread_variable_set(name, nil) }
    end
  end

  GlobalsSnapshot.baseline = Baseline.new
end
