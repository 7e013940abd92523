#include "IProcStartUpdateAgent.h"

IProcStartUpdateAgent::~IProcStartUpdateAgent() = default;
