// SIGINT and SIGTERM end the input, not the process; a second one of a kind ends the process,
// should it hang in a write.
#ifndef QLX_TOOLS_STOPSIGNAL_H
#define QLX_TOOLS_STOPSIGNAL_H

class StopSignal {
 public:
  // Takes both signals over, for the rest of the process. One object at a time.
  StopSignal();

  // Waits until a read of the descriptor would not block; false once a stop was requested.
  bool waitReadable(int descriptor) const;

  bool requested() const;
};

#endif
