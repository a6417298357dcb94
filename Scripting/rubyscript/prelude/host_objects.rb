# SPDX-License-Identifier: MIT
# What passes between a macro and its host: dates, the host's objects, their errors.

module ActiveScript
  MAIN = TOPLEVEL_BINDING.receiver

  # Ends an interrupted macro where it cannot be left otherwise. It does not depend on methods of
  # Exception that a macro may redefine.
  class Stop < Exception
    def initialize(*) = nil
    def exception(*) = self
  end

  # A date on its way to the host.
  OleDate = Struct.new(:days)

  OLE_EPOCH = Time.utc(1899, 12, 30)
  OLE_YEARS = (100..9999).freeze

  class << self
    attr_accessor :interrupter # a thread of the engine's own

    # nil for what is neither Time nor Date. The host gets the time as its own zone shows it.
    def ole_date(value)
      return unless Time === value || (defined?(::Date) && ::Date === value)
      raise RangeError, "year out of a COM date's range: #{value.year}" unless OLE_YEARS.cover?(value.year)
      OleDate.new(ole_days(shown_as_utc(value)))
    end

    def time_from_ole(days)
      whole = days.truncate
      time = OLE_EPOCH + whole * 86_400 + Rational(((days - whole).abs * 86_400_000).round, 1000)
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
    attr_reader :name, :hresult, :source, :wcode, :help_file, :help_context

    def initialize(message, name = nil, hresult = 0x80004005, source = nil, wcode = 0, help_file = nil,
                   help_context = 0)
      super(message)
      @name, @hresult, @source = name, hresult, source
      @wcode, @help_file, @help_context = wcode, help_file, help_context
    end

    def self.for(object, name, hresult, description, source, *details)
      new("#{called(object, name)}: #{reason(hresult, description, source)}", name, hresult, source, *details)
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
    # Names that a host object may well have, and that are not needed from Object.
    %i[clone display dup enum_for extend freeze itself method public_method singleton_method tap then
       to_enum yield_self !~ =~].each { |name| undef_method name }

    # Ruby's own questions about conversions are not for the host.
    ASKED_BY_RUBY = %i[
      to_a to_ary to_c to_f to_h to_hash to_i to_int to_io to_open to_path to_proc to_r to_regexp to_str to_sym
      coerce deconstruct deconstruct_keys exception marshal_dump _dump _dump_data
    ].freeze
    private_constant :ASKED_BY_RUBY

    def respond_to_missing?(name, _include_all)
      !ASKED_BY_RUBY.include?(name) && __knows(name)
    end

    def inspect = "#<ActiveScript::ComObject#{" #{__name}" if __name}>"
    alias to_s inspect
  end
end
