// The user's "org.eclipse.update/platform.xml", made once from the installation's template.
#ifndef LAUNCHER_USER_AREA_PLATFORM_XML_H
#define LAUNCHER_USER_AREA_PLATFORM_XML_H

#include "launcher/properties/property_list.h"

#include <string>

/// Copies the template line by line to `configDir`, with the JVM feature's id and version from
/// `props` (a borrowed copy) put in, or, with `replaceFeatureLines`, "<feature>" in the place of
/// each line that names one. Returns 0 when the file was made or deliberately not made (it exists;
/// "update.policy.managed" is "false"; the "userpb" configuration), -1 when a file could not be
/// opened (logged, QVMRL0104E or QVMRL0139E). A missing value (QVMRL0101E, QVMRL0102E) or a failed
/// write (QVMRL0103E) is logged and cuts the copy short, for good.
/// Fatal: "QVMRL0039E: Unable to create %ls directory.".
int createPlatformXML(const std::wstring& configDir, const std::wstring& baseLocation,
                      PropertyList props, bool replaceFeatureLines);

#endif
