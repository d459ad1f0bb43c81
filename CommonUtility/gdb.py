"""Lists the library's live objects in gdb: mutexes with their holders, semaphores, threads, timers.

    (gdb) source share/varnekutils_ltn/gdb.py
    (gdb) varnek

The library must have debug information; the packaged one has it in libvarnekutils-ltn-dbg. The script works on a
stopped process and on a core dump. It reads structures of glibc and libstdc++, so it works only on a PC."""

import gdb


def variable(name):
    symbol = gdb.lookup_static_symbol(f'(anonymous namespace)::{name}') or gdb.lookup_global_symbol(name)
    if symbol is None:
        raise gdb.GdbError('libvarnekutils_ltn.so is not loaded, or its debug information is missing. For the packaged '
                           'library, install libvarnekutils-ltn-dbg; build any other one with -g and do not strip it.')
    return symbol.value()


def table(name):
    """Yields the handle, name and Info of each used slot of a slot table."""
    found = variable(name)
    base = found['slots_']
    for i in range(base.type.range()[1] + 1):
        handle = int(base[i]['handle']['_M_i'])
        if handle > 0:
            yield handle, text(found['names_'][i]), base[i]['info']


def text(words):
    """Returns the text in an array of any type, up to a NUL."""
    size = words.type.sizeof
    content = gdb.selected_inferior().read_memory(int(words.address), size).tobytes()
    return content.split(b'\0')[0].decode(errors='replace')


def thread_names():
    return {thread.ptid[1]: thread.name for thread in gdb.selected_inferior().threads()}


def mutexes():
    names = thread_names()
    for handle, name, info in table('gMutexArr'):
        data = info['linuxMutex']['__data']
        owner = int(data['__owner'])
        held = f'held by {names.get(owner, "?")} (LWP {owner})' if int(data['__lock']) else 'free'
        yield f'{handle:6}  {name:31}  {held}'


def units(semaphore):
    """Returns the units left. glibc stores them in the first word; on 32-bit systems the lowest bit is a flag."""
    word = gdb.lookup_type('unsigned int').pointer()
    value = int(semaphore.address.cast(word).dereference())
    return value if word.sizeof == 8 else value >> 1


def semaphores():
    for handle, name, info in table('gSemArr'):
        yield f'{handle:6}  {name:31}  units {units(info["linuxSem"])}'


def threads():
    for handle, name, info in table('gThreadInfoArr'):
        # The block of an ended thread is idle, or another thread has it.
        ended = '' if int(info['running']['hHandle']) == handle else ', thread has ended'
        yield f'{handle:6}  {name:31}  messages {int(info["queue"]["MsgQ_"]["count"])}{ended}'


def timers():
    timer_table = variable('gTimerArr')
    for handle in range(timer_table.type.range()[1] + 1):
        info = timer_table[handle]
        if info['bUsed']:
            yield f'{handle:6}  {text(info["szTmName"]):31}  ' + ('started' if info['bAwaited'] else 'idle')


class Varnek(gdb.Command):
    """Lists the live mutexes, semaphores, threads and timers of varnekutils_ltn."""

    def __init__(self):
        super().__init__('varnek', gdb.COMMAND_DATA)

    def invoke(self, argument, from_tty):
        for title, lines in (('Mutexes', mutexes), ('Semaphores', semaphores), ('Threads', threads),
                             ('Timers', timers)):
            print(title)
            for line in lines():
                print(line)


Varnek()
