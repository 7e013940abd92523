#pragma once

// Everything a client of the task scheduler layer uses.
#include "ComPtr.h"
#include "IPersistFile.h"
#include "ITask.h"
#include "ITaskScheduler.h"
#include "ITaskTrigger.h"
#include "TaskSchedulerSettings.h"
#include "Win32Com.h"
