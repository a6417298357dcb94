# SPDX-License-Identifier: MIT
# The Ruby half of a script engine.

module ActiveScript
  # What one script engine compiles and runs, in a world of its own: entered around everything it
  # does. Contexts nest when a function of the host runs another macro.
  class Context
    Source = Struct.new(:lines, :first_line, :cookie)

    # One run of the macro's code: how many frames belong to outer macros, which Ractors were there
    # before, and its errors in order.
    Work = Struct.new(:outer_frames, :ractors, :errors)

    ENTERED = [] # innermost last
    METHOD = Kernel.instance_method(:method)
    private_constant :ENTERED, :METHOD

    class << self
      def current = ENTERED.last
      attr_accessor :mute_host
    end

    attr_reader :byte_host # whether texts go to it as bytes
    attr_reader :fiber     # the one that the macro was started in
    attr_reader :compiling # a text, when the items may be still to come

    def initialize(byte_host)
      @byte_host = byte_host
      @items = {}
      @sources = {}
      @queue = []
      @persistent = []
      @exit_blocks = []
      @works = [] # innermost last
      @finalizers = {} # by the ids of their objects
      @left_open = []
      @output = HostOutput.new(self, STDOUT)
      @error_output = HostOutput.new(self, STDERR)
      @globals_snapshot = GlobalsSnapshot.new({ "$stdout": @output, "$stderr": @error_output })
    end

    def add_item(name, object)
      @items[name] = object
      @globals_snapshot.main.instance_variable_set(:"@#{name}", object)
    end

    # The first item that has a function `message`; nil without one. An 8-bit host tells its user of
    # names it does not know, so it is asked once in the process.
    def messenger
      return @messenger if defined?(@messenger) || !ActiveScript.can_call? || @items.empty?
      @messenger = @items.values.find { |item| item.respond_to?(:message) } unless byte_host && Context.mute_host
      Context.mute_host = true if byte_host && !@messenger
      @messenger
    end

    # For the next run. Persistent code also runs in the context's successor. The cookie is the host's
    # own name for the text. Its warnings wait for the run, and without one for the end; they are dropped
    # beside a syntax error.
    def compile(source, first_line, cookie, persistent)
      @compiling = true
      name = @sources.empty? ? "macro" : "macro#{@sources.size + 1}"
      source = source.b.delete_prefix("\xEF\xBB\xBF".b).force_encoding(Encoding::UTF_8)
      @sources[name] = Source.new(source.b.split(/\r?\n/n), first_line, cookie)
      @data = source.match(/^__END__(?:\r?\n(.*)|\z)/m)&.then { |match| match[1].to_s } if source.valid_encoding?
      RubyVM.keep_script_lines = true
      code = RubyVM::InstructionSequence.compile(source, name, nil, first_line)
      ActiveScript.label_as_main(code)
      @queue.push(code)
      @persistent.push(code) if persistent
      nil
    rescue SyntaxError
      @error_output.drop
      raise
    ensure
      RubyVM.keep_script_lines = false
      @compiling = false
    end

    # What a thread of the macro's raises here waits until it is done. `leave` returns whether threads
    # were left running: their `ensure` blocks may have changed classes.
    def enter = Thread.handle_interrupt(Object => :never) { begin_part }
    def leave = Thread.handle_interrupt(Object => :never) { end_part }

    # Called with the macro's methods and constants in place, for the threads' `ensure` blocks, and by
    # `leave` without them, in case they have prevented it. Whether threads were left running.
    def end_threads(seconds = 1)
      return false if ENTERED[-2].equal?(self)
      threads = ALL_THREADS.call.reject { |thread| @threads.any? { |each| GlobalsSnapshot.same?(each, thread) } }
      threads.each { |thread| thread.kill.join(seconds) }
      threads.any?
    end

    def put_aside = @globals_snapshot.put_aside
    def put_back = @globals_snapshot.put_back

    # Threads that are not the macro's to see.
    def foreign_threads = @threads - [Thread.main]

    # --- Around the macro's own code, which the native part calls ---------------------------------

    def main = @globals_snapshot.main

    def start_work
      @works.push(Work.new(ENTERED.size > 1 ? caller : [], ractors, []))
    end

    # What is compiled and has not run.
    def take_codes
      codes, @queue = @queue, []
      Object.const_set(:DATA, StringIO.new(@data)) if @data && !Object.const_defined?(:DATA)
      @error_output.pass_on
      codes
    end

    # The next block of `at_exit`, or nil. `error` is the last one that the code or a block has raised.
    def next_exit_block(error)
      errors = @works.last.errors
      errors.push(error) if error && !errors.last.equal?(error)
      @exit_blocks.pop if @works.size == 1
    end

    # The error to report to the host, or nil.
    def finish_work
      @outer_frames = @works.last.outer_frames
      error = choose_error(@works.last.errors)
      finish_output(error)
      error
    end

    def end_work
      work = @works.pop or return
      @outer_frames = work.outer_frames
      end_ractors(work.ractors) if @works.empty?
    end

    # Runs once: when its object is collected, or at the end of the macro.
    def finalizer(id, callable)
      (@finalizers[id] ||= []).push(callable)
      proc { @finalizers.delete(id)&.each { |each| each.call(id) } }
    end

    def forget_finalizers(id) = @finalizers.delete(id)

    def run_finalizers
      return if @finalizers.empty?
      enter
      begin
        while (id, callables = @finalizers.shift)
          callables.each { |each| run_finalizer(each, id) }
        end
      ensure
        leave
      end
    end

    # Files that the macro has left open would stay locked. Closing the pipe of a process would wait
    # for its end.
    def close
      @error_output.finish
      @left_open.each { |file| quietly { file.close unless file.closed? || file.pid } }
    end

    # What goes on after the engine has been reset; nil when nothing does.
    def successor
      Context.new(@byte_host).tap { |context| context.inherit(@sources, @persistent) } unless @persistent.empty?
    end

    # Whether the host may call the name: what the macro has defined at its top level.
    def defines?(name)
      path, = METHOD.bind_call(@globals_snapshot.main, name).source_location
      path ? @sources.key?(path) : false
    rescue NameError
      false
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
    # cookie of its source. Of an interruption the text is the host's own. The message comes from the
    # macro's own code, in any encoding.
    def describe(error, host_text, message)
      @described, @message = error, message
      name, line, column = syntax_position(error) || run_time_position(error)
      text = line_text(name, line)
      [description(error, host_text), line ? line - 1 : 0, column_in(text, column), text.to_s,
       @sources[name]&.cookie.to_i]
    end

    private

    def begin_part
      outer = ENTERED.last
      ENTERED.push(self)
      return if outer.equal?(self)
      outer&.put_aside
      @threads = ALL_THREADS.call
      @fiber = Fiber.current
      @descriptor = ActiveScript.lowest_descriptor
      @files = outer ? open_files : []
      @globals_snapshot.put_back
    end

    def end_part
      threads = end_threads(0.2)
      ENTERED.pop
      outer = ENTERED.last
      return false if outer.equal?(self)
      flush_files
      put_aside
      outer&.put_back
      threads
    end

    MAIN_ONLY = [Ractor.main].freeze
    private_constant :MAIN_ONLY

    def ractors = Ractor.count > 1 ? ObjectSpace.each_object(Ractor).to_a : MAIN_ONLY

    # They run in parallel, so they are given a moment to end.
    def end_ractors(others)
      (ractors - others).each { |ractor| ActiveScript.end_ractor(ractor) }
      100.times { Ractor.count > others.size ? sleep(0.01) : break }
    end

    def run_finalizer(callable, id)
      callable.call(id)
    rescue Exception => error
      @error_output.write(description(error, nil), "\n")
    end

    # As in Ruby, the last error decides over success, and each one is shown. Those that are not
    # reported go to the error output.
    def choose_error(errors)
      shown = errors.reject { |error| SystemExit === error && !aborted?(error, message_of(error)) }
      last = errors.last
      success = !last || (SystemExit === last && last.success?)
      reported = shown.first || last unless success
      shown.each do |error|
        @error_output.write(description(error, nil), "\n") unless error.equal?(reported)
      end
      reported
    end

    # The host's function may fail; the macro's error comes first.
    def finish_output(error)
      @output.finish
      @error_output.finish
    rescue StandardError
      raise unless error
    end

    # `closed?` raises for a stream that was allocated but never opened.
    def open_files = ObjectSpace.each_object(IO).select { |file| quietly { !file.closed? } }

    # What Ruby does when its process ends. The search is only made when a file has been left open.
    def flush_files
      STDOUT.flush
      return if ActiveScript.lowest_descriptor == @descriptor
      @left_open |= open_files - @files - [STDIN, STDOUT, STDERR]
      @left_open.each { |file| quietly { file.flush } }
    end

    # Closed, not writable, or the other end is gone.
    def quietly
      yield
    rescue IOError, SystemCallError
      nil
    end

    # --- Errors --------------------------------------------------------------------------------

    # "macro:LINE: ..." and, in the next two lines, a piece of the line and a mark below its place.
    def syntax_position(error)
      return unless SyntaxError === error
      head, piece, mark = message_of(error).b.split("\n", 3)
      name, line = /\A(macro\d*):(\d+):/n.match(head)&.captures
      name = name&.dup&.force_encoding(Encoding::UTF_8)
      return unless @sources.key?(name)
      [name, line.to_i, marked_column(line_text(name, line.to_i).to_s.b, piece.to_s, mark.to_s)]
    end

    # In bytes. CRuby shows long lines cut, with three dots.
    def marked_column(line, piece, mark)
      place = mark.index("^") or return 0
      cut = mark.start_with?("...") ? 3 : 0
      (line.index(piece[cut..].delete_suffix("...")) || 0) + place - cut
    end

    def location_of(error) = own_frames(error.backtrace_locations.to_a).find { |each| @sources.key?(each.path) }

    def run_time_position(error)
      location = location_of(error)
      return [location.path, *place_of(error, location)] if location
      frame = own_frames(Array(error.backtrace)).find { |each| @sources.key?(each[/\A[^:]*/]) }
      frame ? [frame[/\A[^:]*/], whole_line(frame)[/:(\d+)/, 1].to_i, 0] : [nil, nil, 0]
    end

    # CRuby keeps lines of running code as signed numbers of so many values. Nodes have the whole number,
    # counted from the text's first line.
    LINES = 131_072
    private_constant :LINES

    # The line, and the column in bytes. The library's part that is loaded changes no message. CRuby
    # knows where the node of a frame begins.
    def place_of(error, location)
      node = RubyVM::AbstractSyntaxTree.of(location, keep_script_lines: true)
      before = @sources[location.path].first_line - 1
      line = location.lineno + Rational(node.first_lineno + before - location.lineno, LINES).round * LINES
      require "error_highlight/base"
      spot = ErrorHighlight.spot(node, point_type: :name, name: error.name) if NameError === error
      return [line, spot[:first_column]] if spot && spot[:first_lineno] + before == line
      [line, node.first_lineno + before == line ? node.first_column : 0]
    rescue StandardError, LoadError
      [location.lineno % LINES, 0]
    end

    def whole_line(frame) = frame.sub(/(?<=:)-\d+/) { |line| line.to_i + LINES }

    def line_text(name, line)
      source = @sources[name]
      text = source.lines[line - source.first_line] if source && line >= source.first_line
      text&.dup&.force_encoding(Encoding::UTF_8)
    end

    # In units of the text as the host has it: bytes for an 8-bit host, else UTF-16.
    def column_in(text, bytes)
      return 0 unless text && bytes <= text.bytesize
      before = text.byteslice(0, bytes)
      byte_host ? bytes : before.length + before.scrub.each_codepoint.count { |each| each > 0xFFFF }
    end

    def message_of(error)
      message = GlobalsSnapshot.same?(@described, error) ? @message : error.message.to_s
      return message.scrub if message.encoding == Encoding::UTF_8
      return message.b.force_encoding(Encoding::UTF_8).scrub if message.encoding == Encoding::BINARY
      message.encode(Encoding::UTF_8, invalid: :replace, undef: :replace)
    rescue Stop
      raise
    rescue Exception
      ""
    end

    # Below them stand those of a macro that waits for this one, whose texts have the same names.
    def own_frames(frames)
      outer = @outer_frames.to_a
      return frames if outer.empty? || frames.last(outer.size).map(&:to_s) != outer
      frames.first(frames.size - outer.size)
    end

    def description(error, host_text)
      message = message_of(error)
      return message if !host_text && aborted?(error, message)
      message = error.class.name.to_s if message.empty?
      first, rest = message.split("\n", 2)
      frames = own_frames(Array(error.backtrace)).select { |each| @sources.key?(each[/\A[^:]*/]) }
                                     .reject { |each| each.end_with?("in `method_missing'") }
                                     .map { |each| whole_line(each).sub("<compiled>'", "<main>'") }
      text = SyntaxError === error ? message : ["#{first}#{hint(error)} (#{error.class})", rest].compact.join("\n")
      [host_text || text, *frames.first(20).map { |frame| "\tfrom #{frame}" }].join("\n")
    end

    # By `abort` with a text, which is for the user: neither class nor backtrace would help him. Without
    # one, and by `exit`, the text is CRuby's own.
    def aborted?(error, message) = SystemExit === error && !["", "exit"].include?(message)

    # For the two ways to miss an item: its name without the @, and its variable in another object.
    def hint(error)
      missed = error.instance_of?(NameError) && error.name.to_s
      return ": the host's object is @#{missed}" if @items.key?(missed)
      item = nil_variable(error)
      ": this object has no @#{item} unless it is handed over" if @items.key?(item)
    end

    # The name of the instance variable that is nil and was called; nil when it was another thing.
    def nil_variable(error)
      return unless NoMethodError === error && NilClass === error.receiver
      node = RubyVM::AbstractSyntaxTree.of(location_of(error), keep_script_lines: true)
      variable, name = node.children if node.type == :CALL
      variable.children.first.to_s.delete_prefix("@") if name == error.name && variable.type == :IVAR
    rescue StandardError
      nil
    end
  end
end
