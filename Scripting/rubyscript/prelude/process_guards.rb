# SPDX-License-Identifier: MIT
# What a macro must not do to the process it is a guest of.

module ActiveScript
  # A macro that is to end is not held up by `rescue Exception`.
  module Unrescuable
    def ===(error) = !(Stop === error) && super
  end
  Exception.singleton_class.prepend(Unrescuable)
  def Stop.===(error) = equal?(error.class)

  ALL_THREADS = Thread.method(:list)
  private_constant :ALL_THREADS

  # The engine's own thread, and those of a macro that waits for this one, are nobody's to join or kill.
  module ThreadList
    def list = super - [ActiveScript.interrupter] - (Context.current&.foreign_threads || [])
  end
  Thread.singleton_class.prepend(ThreadList)

  # A macro that is started inside a fiber of another one must not yield for it.
  module FiberGuard
    def yield(*)
      return super unless ::Fiber.current.equal?(Context.current&.fiber)
      raise FiberError, "can't yield from root fiber"
    end
  end
  Fiber.singleton_class.prepend(FiberGuard)

  # The process's own streams stay open and where they are.
  [STDIN, STDOUT, STDERR].each do |stream|
    def stream.close = nil

    def stream.reopen(*)
      raise NotImplementedError, "the stream is the host's; assign to $stdin, $stdout or $stderr instead"
    end
  end

  # The process is the host's: what would end or replace it ends the macro at most.
  module ProcessGuards
    private

    def at_exit(&block)
      raise ArgumentError, "called without block" unless block
      Context.current.at_exit(block)
    end

    def exit!(status = false) = ::Kernel.exit(status)

    # The host is told the text with the error, which would come a second time.
    def abort(*message)
      return super unless message.size == 1 && HostOutput === $stderr
      ::Kernel.raise ::SystemExit.new(false, ::String.new(*message))
    end

    def exec(*)
      raise NotImplementedError, "exec would replace the host's process; use system or spawn"
    end
  end
  Kernel.prepend(ProcessGuards)

  # As functions of a module they can be called from everywhere.
  module PublicProcessGuards
    include ProcessGuards
    public(*ProcessGuards.private_instance_methods)
  end
  Kernel.singleton_class.prepend(PublicProcessGuards)
  Process.singleton_class.prepend(PublicProcessGuards)

  module ProcessKillGuard
    def kill(signal, *processes)
      name = ::Integer === signal ? signal : signal.to_s.delete_prefix("SIG")
      asks = [0, "EXIT"].include?(name) # only whether the process is there
      return super if asks || processes.none? { |id| id == ::Process.pid || id.zero? }
      raise SignalException, name
    end
  end
  Process.singleton_class.prepend(ProcessKillGuard)
end
