// Terms of the default source, and short descriptions of files.
#pragma once

#include <filesystem>
#include <string>

namespace tessaly::data {

/// One line for the manifest: the terms of the KEMAR measurement.
std::string kemarLicence();

/// Authors and terms of the KEMAR measurement: the package's copyright text if installed, else the
/// same terms as kept here.
std::string kemarAttribution();

/// The stanza of a Debian copyright file that covers the KEMAR set; empty if there is none.
std::string kemarStanza(const std::string& copyrightText);

/// What a file seems to be by its first bytes, e.g. "a PNG picture"; `fallback` is put behind
/// "an HDF5 file, " if it looks right at the start.
std::string describeContent(const std::filesystem::path& path, const std::string& fallback);

/// The text up to the first line break.
std::string firstLine(const std::string& text);

}  // namespace tessaly::data
