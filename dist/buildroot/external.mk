include $(sort $(wildcard $(BR2_EXTERNAL_VELL_PATH)/package/*/*.mk))
