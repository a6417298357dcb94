# SPDX-License-Identifier: MIT
# "Did you mean?" in the messages of errors, as plain Ruby has it.

module ActiveScript
  # Loads the library with the first message that may have a suggestion: it would double the time
  # that Ruby takes to start.
  module Suggestions
    def to_s
      Suggestions.load_library
      to_s # now the library's
    end

    def self.load_library
      remove_method(:to_s)
      require "did_you_mean"
    rescue StandardError, LoadError
      nil
    end
  end
  [KeyError, LoadError, NameError, NoMatchingPatternKeyError].each { |error| error.prepend(Suggestions) }
end
