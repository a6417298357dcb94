# SPDX-License-Identifier: MIT
# Macros that leave something behind in COM, through the library win32ole.
# --- objects that are still referenced
require 'win32ole'
$kept = Array.new(20) { WIN32OLE.new('Scripting.Dictionary') }
$kept.each_cons(2) { |a, b| a.Add('next', b) }
# --- a cycle of a Ruby object and a component
require 'win32ole'
dictionary = WIN32OLE.new('Scripting.Dictionary')
dictionary.Add('self', proc { dictionary })
# --- a Ruby object that a component calls later
require 'win32ole'
document = WIN32OLE.new('Msxml2.DOMDocument')
document.onreadystatechange = proc { raise 'too late' }
document.load('C:/windows/win.ini')
# --- an object that has been released
require 'win32ole'
dictionary = WIN32OLE.new('Scripting.Dictionary')
dictionary.ole_free
dictionary.Count rescue nil
WIN32OLE.allocate.Count rescue nil
WIN32OLE_EVENT.allocate.unadvise rescue nil
# --- enumerators that are left
require 'win32ole'
dictionary = WIN32OLE.new('Scripting.Dictionary')
3.times { |i| dictionary.Add(i, i) }
dictionary.each { break }
$enumerator = dictionary.each
$enumerator.next
# --- objects that the collector finds
require 'win32ole'
200.times { WIN32OLE.new('Scripting.Dictionary').Add('x', WIN32OLE_VARIANT.new([1, 'a'])) }
GC.start
# --- redefined methods
require 'win32ole'
class WIN32OLE
  def ole_free = raise('no')
end
# --- a message loop, and another thread
require 'win32ole'
WIN32OLE_EVENT.message_loop
Thread.new { WIN32OLE.new('Scripting.Dictionary').Add('x', 1) }.join
# --- COM given back by hand
require 'win32ole'
WIN32OLE.ole_initialize
WIN32OLE.ole_uninitialize
