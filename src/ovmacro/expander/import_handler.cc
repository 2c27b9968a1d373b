#include "ovmacro/expander/import_handler.h"

namespace orvan {

bool ImportHandler::HandleImportPath(const basic_xstring&, const char*) { return false; }

}  // namespace orvan
