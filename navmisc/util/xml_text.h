// Text made safe for XML documents. The exporters write some texts as they are (their documents
// are kept byte for byte); a caller that needs well-formed documents hands them copies of its
// records with texts made safe here.
#pragma once

#include <cstddef>

#include "navmisc/platform/cstring.h"

namespace navmisc {

// `text` as XML character data: "&", "<", ">" and the double quote as entities, a CR LF pair as
// "&#13;", characters XML cannot hold (control characters other than tab, LF and CR, surrogates,
// U+FFFE and U+FFFF) left out. Cut before the first character or entity that would take its
// UTF-8 form beyond `maxBytes` bytes, so that an exporter's own limit never splits an entity.
CString XmlText(const CString& text, size_t maxBytes);

// `text` with only the characters XML can hold, for fields that the exporter escapes itself.
CString XmlCharacters(const CString& text);

}  // namespace navmisc
