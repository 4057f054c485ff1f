#pragma once

#include <string>
#include <vector>

namespace dravikHost {

// For people: what became of a configuration document that the plug-in took or refused.

// Why it was refused: the key, its value, what is wrong with it, and which keys had been applied
// before it. The payload of the failure names the place in the plug-in, which says what was wrong;
// of a failure that is not the document's the payload itself is the answer.
std::string refusalText(const std::string& document, const std::string& payload);

// What a document that was taken does otherwise than it looks: members that set nothing, as they
// are misspelt or stand there twice, and values that are read as others.
std::vector<std::string> documentNotes(const std::string& document);

} // namespace dravikHost
