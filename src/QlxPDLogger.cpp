// The problem-determination logger: a basic logger that stamps every event with the identity of the
// product and of the place where it runs, and with its message identifier.
#include <qlx/class/logger.h>

#include <array>

#include <qlx/class/msgid.h>
#include <qlx/class/object.h>
#include <qlx/event.h>
#include <qlx/memory.h>
#include <qlx/system.h>

#include "object/QlxClasses.h"
#include "object/QlxObjClass.h"
#include "record/QlxLoggedEvent.h"
#include "QlxObject.h"
#include "util/CxStatus.h"

namespace {

struct PDLoggerVars {
  char *organization;
  char *product;
  char *component;
  char *client;
  char *server;        // at first the host's name
  char *serverFormat;  // at first "IP"
  char *productInstance;
  QlxObject *idFormatter;  // counted: the object that all loggers of this class share
};

// A stamped value: its property, the same on the logger and on the event, and where the logger
// keeps it (owned, null at first unless said otherwise; null is not stamped). In the order in which
// an event gets them.
struct Stamp {
  EventKey key;
  char *PDLoggerVars::*value;
};

constexpr Stamp kStamps[] = {
    {EventKey::kOrganization, &PDLoggerVars::organization},
    {EventKey::kProduct, &PDLoggerVars::product},
    {EventKey::kComponent, &PDLoggerVars::component},
    {EventKey::kClient, &PDLoggerVars::client},
    {EventKey::kServer, &PDLoggerVars::server},
    {EventKey::kServerFormat, &PDLoggerVars::serverFormat},
    {EventKey::kProductInstance, &PDLoggerVars::productInstance},
};

constexpr uint32_t kMaxHostChars = 256;

PDLoggerVars *varsOf(QlxObject *logger) {
  return logger ? static_cast<PDLoggerVars *>(logger->vars) : nullptr;
}

char *hostName() {
  std::array<char, kMaxHostChars + 1> name{};  // a name that fills what the call gets has no end
  const CxStatus status = CxSystemGetFQHostname(name.data(), kMaxHostChars);
  return OslStringDup(!cxFailed(status) ? name.data() : "NO_HOSTNAME");
}

}  // namespace

void *QlxPDLoggerFAllocVars(void) {
  auto *vars = static_cast<PDLoggerVars *>(OslMemoryCalloc(1, sizeof(PDLoggerVars)));
  if (!vars) return nullptr;
  vars->server = hostName();
  vars->serverFormat = OslStringDup("IP");
  vars->idFormatter = qlxIntlGetObject("quill.pdMsgIdFormatter", "qlx_xmlformatter");
  return vars;
}

void QlxPDLoggerFFreeVars(void *block) {
  auto *vars = static_cast<PDLoggerVars *>(block);
  if (!vars) return;
  qlxIntlReleaseObject(vars->idFormatter);
  for (const Stamp &stamp : kStamps) OslMemoryFree(vars->*stamp.value);
  OslMemoryFree(vars);
}

void QlxPDLoggerFCfgChange(QlxObject *logger, const char *key) {
  if (!key) return;
  PDLoggerVars *vars = varsOf(logger);
  for (const Stamp &stamp : kStamps) {
    if (OslStringCmp(nameOf(stamp.key), key) != 0) continue;
    if (!vars) return;
    OslMemoryFree(vars->*stamp.value);
    vars->*stamp.value = qlxIntlGetObjProp(logger, key, nullptr);
    return;
  }
  QlxBasicLoggerFCfgChange(logger, key);
}

static void stampValues(Event *event, const PDLoggerVars *vars) {
  for (const Stamp &stamp : kStamps) {
    if (const char *value = vars->*stamp.value) qlxStampEvent(event, stamp.key, value);
  }
}

void QlxPDLoggerFLog(QlxObject *logger, Event *event, va_list *args) {
  if (!logger || !event) return;
  const PDLoggerVars *vars = varsOf(logger);
  if (vars) stampValues(event, vars);
  qlxStampEventInt(event, EventKey::kProcessId, static_cast<int32_t>(CxProcessGetCurrentID()));
  qlxStampEventInt(event, EventKey::kThreadId, static_cast<int32_t>(CxThreadGetCurrentID()));
  qlxPDXMLUFormatterCacheMessageID(vars ? vars->idFormatter : nullptr, event, args);
  QlxBasicObjectFLog(logger, event, args);
}

const ObjClass qlxPDLoggerClass = {
    .kind = Logger,
    .name = "qlx_pdlogger",
    .description = nullptr,
    .op1 = {.fLog = QlxPDLoggerFLog},
    .fAllocVars = QlxPDLoggerFAllocVars,
    .fFreeVars = QlxPDLoggerFFreeVars,
    .fCfgChange = QlxPDLoggerFCfgChange,
    .own = &kTakesNoNotes,
};
