// A host's handler class, "test_recordinghandler": keeps what reaches it, so that a chain is judged
// by what came out of it. Its keys, opening and closing are the library's.
#ifndef QLX_TESTS_RECORDINGHANDLER_H
#define QLX_TESTS_RECORDINGHANDLER_H

#include <functional>
#include <string>
#include <vector>

#include <qlx/qlx.h>

class RecordingHandler {
 public:
  static constexpr const char *kClass = "test_recordinghandler";

  struct Record {
    std::string handler;  // name of the object that got it
    int32_t level;
    std::u16string text;  // the bound message
    CxStatus status;      // the event's, as it was then
    va_list *args;
  };

  // Registers the class; the object lives until the toolkit is closed.
  RecordingHandler() {
    current() = this;
    QlxAddHandlerClass(kClass, nullptr, nullptr, nullptr, QlxBasicHandlerFCfgChange, process,
                       nullptr, nullptr);
  }
  ~RecordingHandler() { current() = nullptr; }
  RecordingHandler(const RecordingHandler &) = delete;
  RecordingHandler &operator=(const RecordingHandler &) = delete;

  std::vector<Record> records;
  std::function<void(Event *)> alsoDo;  // with every event, under the API lock

  // The texts that came, each with "|" behind it.
  std::u16string texts() const {
    std::u16string all;
    for (const Record &record : records) all += record.text + u"|";
    return all;
  }

 private:
  static RecordingHandler *&current() {
    static RecordingHandler *object;
    return object;
  }

  static void process(QlxObject *handler, Event *event, va_list *args) {
    UChar *text = QlxBindEventUMsg(event, qlxIntlBindUI18Msg, args);
    current()->records.push_back(
        {handler->name, event->level, text ? text : u"<null>", event->status, args});
    OslMemoryFree(text);
    if (current()->alsoDo) current()->alsoDo(event);
    QlxBasicObjectFLog(handler, event, args);
  }
};

#endif
