#include "dravik/timeReferenceMetaData.h"

#include "zvsynctools_cjson/jsonHelperFunctions.h"

using zvsynctools_cjson::getOptionalObjectText;
using zvsynctools_cjson::getOptionalString;

std::string getSelectedTimeReferenceType(const std::string& metaDataJson)
{
    std::string identifier;
    std::string instances;
    std::string instance;
    std::string type;
    if (getOptionalString(metaDataJson, "selectedTRInstID", identifier) &&
        getOptionalObjectText(metaDataJson, "TRs", instances) &&
        getOptionalObjectText(instances, identifier, instance)) {
        getOptionalString(instance, "type", type);
    }
    return type;
}
