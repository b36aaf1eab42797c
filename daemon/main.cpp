// grellon: registers the background activity and gives the main thread to the platform.

#include "daemon/activity_handler.h"
#include "morwick/platform.h"

int main() {
  SystemLog("start grellon");
  RegisterTaskSchedulerActivity();
  RunMainQueue();
}
