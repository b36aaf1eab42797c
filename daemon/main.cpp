// grellon: registers the background activity and gives the main thread to the platform.

#include "daemon/activity_handler.h"
#include "platform/platform.h"

int main() {
  SystemLog("start grellon");
  RegisterTaskSchedulerActivity();
  RunMainQueue();
}
