# SPDX-License-Identifier: MIT
# The engine's Ruby part: what keeps the runs of one interpreter apart (Context), where a macro's
# output goes (HostOutput), the Ruby face of a COM object (ComObject), and what a macro must not do to
# the process it is a guest of. Evaluated once, when the interpreter starts.

require "stringio"

module ActiveScript
  MAIN = TOPLEVEL_BINDING.receiver

  # Ends an interrupted macro where it cannot be left otherwise. No macro should rescue it.
  class Stop < Exception; end

  # A date on its way to the host.
  OleDate = Struct.new(:days)

  OLE_EPOCH = Time.utc(1899, 12, 30)
  OLE_YEARS = (100..9999).freeze

  class << self
    attr_accessor :interrupter # a thread of the engine's own

    # nil for what is neither Time nor Date. The host gets the time as its own zone shows it.
    def ole_date(value)
      case value
      when Time then time = value
      when ->(date) { defined?(::Date) && ::Date === date }
        time = ::DateTime === value ? value.new_offset(value.offset) : value
      else return
      end
      raise RangeError, "year out of a COM date's range: #{time.year}" unless OLE_YEARS.cover?(time.year)
      OleDate.new(ole_days(shown_as_utc(time)))
    end

    def time_from_ole(days)
      whole = days.truncate
      time = OLE_EPOCH + whole * 86_400 + ((days - whole).abs * 86_400).round(3).rationalize(0.0005r)
      Time.local(time.year, time.month, time.day, time.hour, time.min, time.sec + time.subsec)
    end

    private

    def shown_as_utc(time)
      return Time.utc(time.year, time.month, time.day) unless time.respond_to?(:hour)
      fraction = time.respond_to?(:subsec) ? time.subsec : time.sec_fraction
      Time.utc(time.year, time.month, time.day, time.hour, time.min, time.sec + fraction)
    end

    # Before the epoch the whole days count backwards, but the time of day does not.
    def ole_days(time)
      days = (time.to_r - OLE_EPOCH.to_r) / 86_400
      whole = days.floor
      part = days - whole
      (whole.negative? ? whole - part : whole + part).to_f
    end
  end

  # A call of a COM object that failed.
  class ComError < StandardError
    attr_reader :name, :hresult, :source

    def initialize(message, name = nil, hresult = 0x80004005, source = nil)
      super(message)
      @name, @hresult, @source = name, hresult, source
    end

    def self.for(object, name, hresult, description, source)
      new("#{called(object, name)}: #{reason(hresult, description, source)}", name, hresult, source)
    end

    def self.unknown(object, name, hresult)
      NoMethodError.new("#{object || 'the COM object'} has no `#{name}': #{reason(hresult)}", name)
    end

    def self.called(object, name) = "#{object || 'COM object'}.#{name}"

    def self.reason(hresult, description = nil, source = nil)
      text = description || ActiveScript.system_message(hresult)
      format("%s (%s0x%08X)", text.strip, source ? "#{source}, " : "", hresult)
    end
    private_class_method :called, :reason
  end

  # The rest of this class is native: calls, [] and []=.
  class ComObject
    # Names that an object of the host's may well have, and that nobody needs of Object.
    %i[clone display dup enum_for extend freeze itself method methods public_method singleton_method
       tap then to_enum yield_self !~ =~].each { |name| undef_method name }

    # Ruby's own questions about conversions are not for the host.
    ASKED_BY_RUBY = /\A(to_|deconstruct|marshal_|_dump|coerce\z|exception\z|call\z)/
    private_constant :ASKED_BY_RUBY

    def respond_to_missing?(name, _include_all)
      !ASKED_BY_RUBY.match?(name) && __knows(name)
    end

    def inspect = "#<ActiveScript::ComObject#{" #{__name}" if __name}>"
    alias to_s inspect
  end

  # $stdout and $stderr of a macro: whole lines go to the host's function `message`, or straight to
  # the process's own stream when the host has none.
  class HostOutput < StringIO
    LIMIT = 511 # bytes of a text that an 8-bit host takes whole

    def initialize(context, stream)
      super(+"")
      @context = context
      @stream = stream
      @pending = String.new(encoding: Encoding::BINARY)
    end

    def write(*texts)
      texts.map!(&:to_s)
      texts.each { |text| @pending << as_utf8(text).b }
      # A stopped macro's last words have nowhere to go; a thread's wait for the main thread.
      pass_on if ActiveScript.can_call?
      texts.sum(&:bytesize)
    end

    def flush = self
    def sync = true
    def tty? = false
    alias isatty tty?

    # Also the last line, when it has no end.
    def finish
      return if @pending.empty?
      @pending << "\n" if @context.messenger
      pass_on
    end

    private

    PLAIN = [Encoding::UTF_8, Encoding::US_ASCII, Encoding::BINARY].freeze
    private_constant :PLAIN

    def as_utf8(text)
      return text if PLAIN.include?(text.encoding) || !@context.messenger
      text.encode(Encoding::UTF_8, invalid: :replace, undef: :replace)
    end

    def pass_on
      messenger = @context.messenger
      length = messenger ? (@pending.rindex("\n") || -1) + 1 : @pending.bytesize
      return if length.zero?
      text = @pending.slice!(0, length)
      messenger ? show(messenger, text.chomp) : write_through(text)
    end

    def show(messenger, text)
      text.force_encoding(Encoding::UTF_8)
      return messenger.message(text.scrub) unless @context.byte_host
      text = text.b.gsub("\0", "\u2400".b)
      loop do
        piece = text.slice!(0, cut(text))
        messenger.message(piece.force_encoding(Encoding::UTF_8))
        break if text.empty?
      end
    end

    # Never inside a character.
    def cut(text)
      length = LIMIT
      length -= 1 while length > LIMIT - 4 && text.getbyte(length)&.then { |byte| byte & 0xC0 == 0x80 }
      length
    end

    # A program with windows has no such stream.
    def write_through(text)
      @stream.write(text)
      @stream.flush
    rescue IOError, SystemCallError
      nil
    end
  end

  # One script engine's world: its top-level object's content, its top-level methods and constants,
  # its global variables. They exist while the context is entered and are put aside otherwise, so
  # Ruby's own top level serves all of them, one at a time.
  class Context
    Source = Struct.new(:lines, :first_line, :cookie)
    FEATURES = $LOADED_FEATURES
    PATH = $LOAD_PATH.dup.freeze

    ENTERED = [] # innermost last
    private_constant :ENTERED

    class << self
      def current = ENTERED.last
      attr_accessor :baseline

      # What CRuby adds to messages. Loaded when there is one: it takes longer than all the rest.
      def load_hints
        require "error_highlight"
        require "did_you_mean"
      rescue LoadError
        nil
      end
    end

    attr_reader :byte_host # whether texts go to it as bytes

    def initialize(byte_host)
      @byte_host = byte_host
      @items = {}
      @sources = {}
      @queue = []
      @persistent = []
      @exit_blocks = []
      @constants = {}
      @methods = []
      @singleton_methods = []
      @variables = {}
      @globals = {}
      @features = []
      @output = HostOutput.new(self, STDOUT)
      @error_output = HostOutput.new(self, STDERR)
    end

    def add_item(name, object)
      @items[name] = object
      @variables[:"@#{name}"] = object
    end

    # The first item that has a function `message`; nil without one.
    def messenger
      @messenger = @items.values.find { |item| item.respond_to?(:message) } if @messenger.nil?
      @messenger ||= false
      @messenger || nil
    end

    # For the next run. Persistent code also runs in the context's successor. The cookie is the host's
    # own name for the text.
    def compile(source, first_line, cookie, persistent)
      name = @sources.empty? ? "macro" : "macro#{@sources.size + 1}"
      source = source.b.delete_prefix("\xEF\xBB\xBF".b).force_encoding(Encoding::UTF_8)
      @sources[name] = Source.new(source.b.split(/\r\n|[\r\n]/n), first_line, cookie)
      @data = source[/^__END__\r?\n(.*)/m, 1] if source.valid_encoding? && source.include?("__END__")
      RubyVM.keep_script_lines = true
      code = RubyVM::InstructionSequence.compile(source, name, nil, first_line)
      @queue.push(code)
      @persistent.push(code) if persistent
      nil
    ensure
      RubyVM.keep_script_lines = false
    end

    def enter
      outer = ENTERED.last
      ENTERED.push(self)
      return if outer.equal?(self)
      outer&.suspend
      @threads = Thread.list
      resume
    end

    def leave
      ENTERED.pop
      outer = ENTERED.last
      return if outer.equal?(self)
      (Thread.list - @threads).each { |thread| thread.kill.join(1) }
      suspend
      outer&.resume
    end

    # Runs what is compiled; the value of the last code. A macro that ends by `exit` has succeeded.
    def run
      codes, @queue = @queue, []
      result = nil
      Object.const_set(:DATA, StringIO.new(@data)) if @data && !Object.const_defined?(:DATA)
      error = attempt { codes.each { |code| result = code.eval } }
      while (block = @exit_blocks.pop)
        error = attempt(&block) || error
      end
      @output.finish
      @error_output.finish
      raise error if error && !(SystemExit === error && error.success?)
      result
    end

    def call(name, arguments)
      MAIN.__send__(name, *arguments)
    ensure
      @output.finish if ActiveScript.can_call?
    end

    # What goes on after the engine has been reset; nil when nothing does.
    def successor
      Context.new(@byte_host).tap { |context| context.inherit(@sources, @persistent) } unless @persistent.empty?
    end

    # Names that the host may call: what the macro has defined at its top level.
    def defines?(name)
      name = name.to_sym
      baseline = Context.baseline
      MAIN.respond_to?(name, true) && !Kernel.method_defined?(name) &&
        !Kernel.private_method_defined?(name) && !BasicObject.private_method_defined?(name) &&
        !BasicObject.method_defined?(name) && !baseline.methods.key?(name) &&
        !baseline.singleton_methods.key?(name)
    end

    def inherit(sources, codes)
      @sources = sources
      @queue = codes.dup
      @persistent = codes
    end

    def at_exit(block)
      @exit_blocks.push(block)
      block
    end

    # What the host is told of an error: description, line and column from 0, the line's text, the
    # cookie of its source.
    def describe(error)
      Context.load_hints if NameError === error || KeyError === error
      name, line, column = syntax_position(error) || run_time_position(error)
      text = line_text(name, line)
      [description(error), line ? line - 1 : 0, column_in(text, column), text.to_s,
       @sources[name]&.cookie.to_i]
    end

    # --- Putting the world aside -----------------------------------------------------------------

    def suspend
      $VERBOSE = nil # set again from the baseline
      take_constants
      @methods = take_methods(Object, Context.baseline.methods)
      @singleton_methods = take_methods(MAIN.singleton_class, Context.baseline.singleton_methods)
      MAIN.instance_variables.each { |name| @variables[name] = MAIN.remove_instance_variable(name) }
      take_globals
      take_features
      set_trace_func(nil)
      GC.enable
    end

    def resume
      verbose, $VERBOSE = $VERBOSE, nil
      @constants.each { |name, value| Object.const_set(name, value) }
      @constants = {}
      give_methods(Object, @methods)
      give_methods(MAIN.singleton_class, @singleton_methods)
      @variables.each { |name, value| MAIN.instance_variable_set(name, value) }
      @variables = {}
      $VERBOSE = verbose
      @globals.each { |name, value| ActiveScript.set_global(name, value) }
      FEATURES.concat(@features)
      $stdout = @output unless @globals.key?(:$stdout)
      $stderr = @error_output unless @globals.key?(:$stderr)
    end

    private

    def attempt
      yield
      nil
    rescue Stop
      raise
    rescue Exception => error
      error
    end

    # Whether a definition came from a library, which stays loaded, and not from a macro.
    def library?(location)
      path, = location
      path.nil? || path.start_with?(Context.baseline.folder)
    end

    def take_constants
      known = Context.baseline.constants
      Object.constants(false).each do |name|
        next if known.key?(name)
        next known[name] = true if Object.autoload?(name) || library?(Object.const_source_location(name))
        @constants[name] = Object.__send__(:remove_const, name)
      end
    end

    def take_methods(owner, known)
      names = owner.instance_methods(false) + owner.private_instance_methods(false)
      (names - known.keys).filter_map do |name|
        method = owner.instance_method(name)
        next known[name] = nil if library?(method.source_location)
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
      baseline = Context.baseline.globals
      @globals = {}
      global_variables.each do |name|
        next if Context.baseline.fixed_globals.key?(name)
        value = ActiveScript.global(name)
        original = baseline[name]
        next if value.equal?(original)
        @globals[name] = value
        ActiveScript.set_global(name, original)
      end
      $LOAD_PATH.replace(PATH) unless $LOAD_PATH == PATH
      Encoding.default_external = Context.baseline.external
      Encoding.default_internal = nil if Encoding.default_internal
    end

    # Files of the macro's own are loaded anew by the next one.
    def take_features
      @features = FEATURES.reject { |path| path.start_with?(Context.baseline.folder) || !path.include?("/") }
      FEATURES.replace(FEATURES - @features) unless @features.empty?
    end

    # --- Errors --------------------------------------------------------------------------------

    def syntax_position(error)
      return unless SyntaxError === error
      match = /^(macro\d*):(\d+): .*?(?:\n(?<text>.*)\n(?<mark> *[~^]+))?/.match(error.message)
      parts = error.message.b.match(/\A(macro\d*):(\d+):/n)
      return unless match && parts && @sources.key?(parts[1].dup.force_encoding("UTF-8"))
      mark = error.message.b[/^( *)[~^]*\^/n, 1]
      [parts[1].dup.force_encoding("UTF-8"), parts[2].to_i, mark ? mark.bytesize : 0]
    end

    def run_time_position(error)
      location = error.backtrace_locations&.find { |each| @sources.key?(each.path) }
      return [location.path, location.lineno, column_of(error, location)] if location
      frame = Array(error.backtrace).find { |each| @sources.key?(each[/\A[^:]*/]) }
      frame ? [frame[/\A[^:]*/], frame[/:(\d+)/, 1].to_i, 0] : [nil, nil, 0]
    end

    # In bytes. CRuby can tell where the node of a frame begins.
    def column_of(error, location)
      node = RubyVM::AbstractSyntaxTree.of(location, keep_script_lines: true)
      spot = ErrorHighlight.spot(node, point_type: :name, name: error.name) if NameError === error
      return spot[:first_column] if spot && spot[:first_lineno] == location.lineno
      node.first_lineno == location.lineno ? node.first_column : 0
    rescue StandardError
      0
    end

    def line_text(name, line)
      source = @sources[name]
      text = source.lines[line - source.first_line] if source && line >= source.first_line
      text&.dup&.force_encoding(Encoding::UTF_8)
    end

    # In characters.
    def column_in(text, bytes)
      text && bytes <= text.bytesize ? text.byteslice(0, bytes).length : 0
    end

    def description(error)
      message = error.message.to_s
      message = error.class.name.to_s if message.empty?
      first, rest = message.split("\n", 2)
      frames = Array(error.backtrace).select { |each| @sources.key?(each[/\A[^:]*/]) }
                                     .reject { |each| each.end_with?("in `method_missing'") }
                                     .map { |each| each.sub("<compiled>'", "<main>'") }
      text = SyntaxError === error ? message : ["#{first} (#{error.class})", rest].compact.join("\n")
      [text, *frames.first(20).map { |frame| "\tfrom #{frame}" }].join("\n")
    end
  end

  # What every context begins with. Libraries that macros load are added to it.
  class Baseline
    attr_reader :constants, :methods, :singleton_methods, :globals, :fixed_globals, :external, :folder

    # Belong to a frame or a thread, or show something else under another name.
    SPECIAL = /\A\$([~_!@&`'+\d?$<>.;,]|FILENAME|-[pla\dFKi]|KCODE|=|"|:|\*|LOAD.*|PROGRAM_NAME)/
    private_constant :SPECIAL

    def initialize
      @folder = File.dirname($LOAD_PATH.grep(%r{/ruby/\d[^/]*\z}).first.to_s)
      @external = Encoding.default_external
      @constants = Object.constants(false).to_h { |name| [name, true] }
      @methods = names_of(Object)
      @singleton_methods = names_of(MAIN.singleton_class)
      @globals = {}
      @fixed_globals = {}
      global_variables.each { |name| take_global(name) }
    end

    private

    def names_of(owner)
      (owner.instance_methods(false) + owner.private_instance_methods(false)).to_h { |name| [name, true] }
    end

    def take_global(name)
      raise NameError if SPECIAL.match?(name)
      value = ActiveScript.global(name)
      ActiveScript.set_global(name, value)
      @globals[name] = value
    rescue StandardError
      @fixed_globals[name] = true
    end
  end

  # The engine's own thread is nobody's to join or to kill.
  module ThreadList
    def list = super.tap { |threads| threads.delete(ActiveScript.interrupter) }
  end
  Thread.singleton_class.prepend(ThreadList)

  # The process is the host's: what would end or replace it ends the macro at most.
  module Guest
    def at_exit(&block)
      raise ArgumentError, "called without block" unless block
      Context.current.at_exit(block)
    end

    def exit!(status = false) = ::Kernel.exit(status)

    def exec(*)
      raise NotImplementedError, "exec would replace the host's process; use system or spawn"
    end
  end
  Kernel.prepend(Guest)
  Kernel.singleton_class.prepend(Guest)
  Process.singleton_class.prepend(Guest)

  module GuestProcess
    def kill(signal, *processes)
      return super unless processes.any? { |id| id == ::Process.pid || id.zero? }
      raise SignalException, ::Integer === signal ? signal : signal.to_s.delete_prefix("SIG")
    end
  end
  Process.singleton_class.prepend(GuestProcess)

  Context.baseline = Baseline.new
end
