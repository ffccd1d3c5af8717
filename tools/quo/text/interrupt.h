// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TOOL_INTERRUPT_H
#define QUO_TOOL_INTERRUPT_H

namespace tool {

/** Thrown where the program was asked to stop, so that unfinished files are taken away on the way out. */
struct Interrupted {
    int signal;
};

/** From now on SIGINT, SIGTERM and SIGHUP only leave a note for throw_if_interrupted(). A signal that was ignored
 * when the program started stays ignored. */
void note_interrupts();

/** Throws Interrupted when one of the signals has come in. */
void throw_if_interrupted();

/** Ends the program by the signal, as if it had never been caught, so that the caller sees why. */
[[noreturn]] void end_by(int signal);

}  // namespace tool

#endif
