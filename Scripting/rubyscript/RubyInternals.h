// SPDX-License-Identifier: MIT
// Functions that CRuby's library exports but declares in no public header. The build pins CRuby's
// version. They send no message, so a macro that redefines methods does not change what they do.
#pragma once

#include <ruby.h>

extern "C" {
// Thread and Ractor objects hold the structures that these functions take: see RTYPEDDATA_DATA.
void rb_threadptr_pending_interrupt_enque(void* thread, VALUE exception);
void rb_threadptr_interrupt(void* thread);
VALUE rb_ractor_thread_list(void* ractor);

// Kernel#abort and Process.kill.
VALUE rb_f_abort(int count, const VALUE* arguments);
VALUE rb_f_kill(int count, const VALUE* arguments);

const void* rb_iseqw_to_iseq(VALUE instructionSequence);
VALUE rb_iseq_eval(const void* iseq);
}
