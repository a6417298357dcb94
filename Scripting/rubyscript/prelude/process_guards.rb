# SPDX-License-Identifier: MIT
# Keeps a macro from what belongs to the host's process: see also ProcessGuards.cpp.

module ActiveScript
  ALL_THREADS = Thread.method(:list)
  private_constant :ALL_THREADS

  # Hides the engine's thread and those of a macro that waits for this one. A Ractor has only its
  # own threads anyway.
  module ThreadList
    def list
      return super unless ::Ractor.current.equal?(::Ractor.main)
      super - [ActiveScript.interrupter] - (Context.current&.foreign_threads || [])
    end
  end
  Thread.singleton_class.prepend(ThreadList)

  # The process's own streams stay open.
  [STDIN, STDOUT, STDERR].each { |stream| def stream.close = nil }

  FINALIZERS = { define: ObjectSpace.method(:define_finalizer),
                 undefine: ObjectSpace.method(:undefine_finalizer) }.freeze

  # They run when their object is collected, as in Ruby, or at the end of the macro.
  class << ObjectSpace
    def define_finalizer(object, callable = (missing = true), &block)
      callable = block || raise(ArgumentError, "tried to create Proc object without a block") if missing
      unless callable.respond_to?(:call, true)
        raise ArgumentError, "wrong type argument #{callable.class} (should be callable)"
      end
      context = ActiveScript::Context.current
      once = context ? context.finalizer(object.__id__, callable) : callable
      ActiveScript::FINALIZERS[:define].call(object, once)
      [0, callable]
    end

    def undefine_finalizer(object)
      ActiveScript::Context.current&.forget_finalizers(object.__id__)
      ActiveScript::FINALIZERS[:undefine].call(object)
    end
  end
end
