#ifndef WEBAPI_WEBAPI_H
#define WEBAPI_WEBAPI_H

/// Everything that the library offers, for authors of API libraries and of
/// programs that serve or run them.

#include "webapi/APIAuth.h"
#include "webapi/APIBase.h"
#include "webapi/APIDownload.h"
#include "webapi/APIExport.h"
#include "webapi/APIParameter.h"
#include "webapi/APIPolling.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"
#include "webapi/APIRunner.h"
#include "webapi/APITable.h"
#include "webapi/APITaskProgress.h"
#include "webapi/APIUpload.h"
#include "webapi/APIValidator.h"
#include "webapi/HTTPStatus.h"
#include "webapi/WebEntry.h"

#endif
