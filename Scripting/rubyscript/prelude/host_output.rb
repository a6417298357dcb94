# SPDX-License-Identifier: MIT
# Where the output of a macro goes.

require "stringio"

module ActiveScript
  # $stdout and $stderr of a macro: whole lines go to the host's function `message`, or straight to
  # the process's own stream when the host has none.
  class HostOutput < StringIO
    # Longest text in bytes that surely reaches an 8-bit host complete: it cannot distinguish 512
    # bytes from a text that was cut.
    LIMIT = 511

    def initialize(context, stream)
      super(+"")
      @context = context
      @stream = stream
      @pending = String.new(encoding: Encoding::BINARY)
    end

    # What it wrote to before, when it is reopened with it.
    def initialize_copy(original)
      super
      @redirected = original.redirected
    end

    # Sends what follows to a file or another stream, or back to where a copy of this one writes.
    # Child processes keep the process's own stream.
    def reopen(target, mode = "w", **options)
      finish
      flush
      @redirected = case target
                    when HostOutput then target.redirected
                    when IO, StringIO then target
                    else File.open(target, mode, **options)
                    end
      self
    end

    # For child processes: `system(command, out: $stdout)`.
    def to_io = @stream
    def fileno = @stream.fileno

    def inspect = "#<#{self.class}:#{@stream.inspect[/<([A-Z]+)>/, 1]}>"

    def write(*texts)
      return @redirected.write(*texts) if @redirected
      texts.map! { |text| "#{text}" } # `to_s` may return anything
      texts.each { |text| @pending << as_utf8(text).b }
      # A stopped macro's last words have nowhere to go; a thread's wait for the main thread.
      pass_on if ActiveScript.can_call? && !@context.compiling
      texts.sum(&:bytesize)
    end

    def syswrite(text) = write(text)
    def write_nonblock(text, **) = write(text)

    def putc(character)
      write(String === character ? character[0] : (character.to_int & 0xFF).chr)
      character
    end

    def flush
      @redirected&.flush
      self
    end

    def sync = true
    def tty? = false
    alias isatty tty?

    # Also the last line, when it has no end.
    def finish
      return if @pending.bytesize.zero?
      @pending << "\n" if @context.messenger && !@pending.end_with?("\n")
      pass_on
    end

    def drop = @pending.clear

    # What can be passed on by now.
    def pass_on
      return if @pending.bytesize.zero?
      messenger = @context.messenger
      length = messenger ? (@pending.rindex("\n") || -1) + 1 : @pending.bytesize
      return if length.zero?
      text = @pending.slice!(0, length)
      messenger ? show(messenger, text.chomp) : write_through(text)
    end

    protected

    attr_reader :redirected

    private

    PLAIN = [Encoding::UTF_8, Encoding::US_ASCII, Encoding::BINARY].freeze
    private_constant :PLAIN

    def as_utf8(text)
      return text if PLAIN.include?(text.encoding) || (ActiveScript.can_call? && !@context.messenger)
      text.encode(Encoding::UTF_8, invalid: :replace, undef: :replace)
    end

    def show(messenger, text)
      text.force_encoding(Encoding::UTF_8)
      return messenger.message(text.scrub) unless @context.byte_host
      text = text.b.gsub("\0", "\u2400".b)
      return messenger.message(text.force_encoding(Encoding::UTF_8)) if text.bytesize <= LIMIT
      (text.bytesize / (LIMIT - 4) + 1).times do
        piece = text.slice!(0, cut(text))
        messenger.message(piece.force_encoding(Encoding::UTF_8)) if piece.bytesize.positive?
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
end
